// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "plist/JSON.h"

#include <gtest/gtest.h>

#include <limits>
#include <nlohmann/json.hpp>

namespace plist {
namespace {

std::string json(const Value& value) {
  std::string text;
  appendJSON(text, value);
  return text;
}

TEST(JSON, Form) {
  const double infinity = std::numeric_limits<double>::infinity();
  EXPECT_EQ(json(Dictionary{{"type", 176},
                            {"time", Date{1795320000.75}},
                            {"data", Dictionary{{"b", true}, {"a", Array{}}, {"e", Dictionary{}}}},
                            {"bytes", Data{1, 2, 3, 4}}}),
            R"({"type": 176, "time": "2026-11-22T04:00:00Z", )"
            R"("data": {"b": true, "a": [], "e": {}}, "bytes": "AQIDBA=="})");
  EXPECT_EQ(json(Array{INT64_MIN, UINT64_MAX, 1.0, -0.0, 0.1, 1e300, 5e-324, 0.5f, 123456.0}),
            "[-9223372036854775808, 18446744073709551615, 1.0, -0.0, 0.1, 1e+300, 5e-324, 0.5, "
            "123456.0]");
  EXPECT_EQ(json(Array{infinity, -infinity, std::numeric_limits<double>::quiet_NaN()}),
            "[null, null, null]");
  EXPECT_EQ(json(std::string("\"\\/\b\n\r\t\x1F\x7F\xC3\xA4\xFF\0z", 14)),
            R"("\"\\/\u0008\n\r\t\u001f)"
            "\x7F\xC3\xA4\xEF\xBF\xBD"
            R"(\u0000z")");
  const Dictionary twice{{"\x01", 1}, {"\xFF", 2}};
  EXPECT_EQ(json(twice), "{\"\xEF\xBF\xBD\": 2}") << "a key stands once";
}

TEST(JSON, IsOneValidLineWhateverTheBytes) {
  for (int first = 0; first < 256; ++first) {
    for (const char* rest : {"", "\x80", "\xBF\xBF", "\xBF\xBF\xBF", "\"", "\\"}) {
      const std::string bytes = static_cast<char>(first) + std::string(rest);
      const std::string text = json(Dictionary{{bytes, bytes}});
      ASSERT_TRUE(nlohmann::json::accept(text)) << text;
      ASSERT_EQ(text.find('\n'), std::string::npos);
    }
  }
}

TEST(JSON, IndentsContainers) {
  std::string text;
  appendIndentedJSON(text, Dictionary{{"d", Dictionary{}}, {"a", Array{1, Array{}, "x"}}});
  EXPECT_EQ(text, "{\n  \"d\": {},\n  \"a\": [\n    1,\n    [],\n    \"x\"\n  ]\n}");
}

}  // namespace
}  // namespace plist
