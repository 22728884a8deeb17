// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include <gtest/gtest.h>

#include "tools/pelloran/ImportLine.h"

#include <utility>
#include <vector>

namespace {

using Kind = host::CounterChange::Kind;

constexpr pelloran::Moment kNow{20000, 3600};

TEST(PelloranImportLine, NumbersKeepTheirValueAndMissingFieldsMeanNow) {
  struct {
    const char* line;
    Kind kind;
    std::int64_t amount;
    double sample;
    std::int32_t day, seconds;
  } const cases[] = {
      {R"({"set": "k", "value": 9223372036854775807})", Kind::set, INT64_MAX, 0, 20000, 3600},
      {R"({"add": "k", "value": -9223372036854775808})", Kind::add, INT64_MIN, 0, 20000, 3600},
      {R"({"add": "k", "value": 1e3, "day": 5.0})", Kind::add, 1000, 0, 5, 3600},
      {R"({"push": "k", "value": 18446744073709551615})", Kind::push, 0, 18446744073709551615.0,
       20000, 3600},
      {R"({"push": "k", "value": 5e-324, "day": "yesterday", "seconds": 0})", Kind::push, 0, 5e-324,
       19999, 0},
      {R"( {"seconds": 86399, "day": "today", "value": 1, "push": "k"} )", Kind::push, 0, 1, 20000,
       86399},
      {R"({"set": "k", "value": 1, "day": "2026-11-22"})", Kind::set, 1, 0, 20779, 3600},
  };
  for (const auto& row : cases) {
    const auto parsed = pelloran::parseImportLine(row.line, kNow);
    ASSERT_TRUE(parsed) << row.line << ": " << parsed.error().text;
    EXPECT_EQ(parsed->key, "k");
    EXPECT_EQ(parsed->change.kind, row.kind) << row.line;
    EXPECT_EQ(parsed->change.amount, row.amount) << row.line;
    EXPECT_EQ(parsed->change.sample, row.sample) << row.line;
    EXPECT_EQ(parsed->change.day, row.day) << row.line;
    EXPECT_EQ(parsed->change.seconds, row.seconds) << row.line;
  }
}

TEST(PelloranImportLine, AnythingElseIsRefusedWithAReason) {
  const std::string deep(100000, '['), longest(1025, 'k');
  std::vector<std::string> lines = {"", "1", "null", "[]", "{", deep, "{\"set\": " + deep};
  // Beginnings, and contents that can't follow.
  const std::pair<const char*, std::vector<std::string>> contents[] = {
      {"{", {""}},
      {R"({"set": "k")",
       {"", R"(, "value": 1} x)", R"(, "value": 1, "push": "k")", R"(, "set": "k", "value": 1)",
        R"(, "value": 1, "value": 2)", R"(, "value": 1, "more": 2)"}},
      {R"({"set": "k", "value": )",
       {R"({"value": 1})", "null", R"("1")", "1.5", "9223372036854775808", "-1e19"}},
      {R"({"push": "k", "value": )", {"1e999", "NaN"}},
      {R"({"value": 1, "push": )",
       {"5", R"("")", R"("\u0000")", R"("\ud800")", "\"\xff\"", '"' + longest + '"'}},
      {R"({"push": "k", "value": 1, "day": )", {"2147483648", "0.5", "-1", R"("-1")", R"("soon")"}},
      {R"({"push": "k", "value": 1, "seconds": )", {"86400", "-1", R"("1")"}}};
  for (const auto& [beginning, refused] : contents) {
    for (const std::string& content : refused) lines.push_back(beginning + content + "}");
  }
  for (const auto& line : lines) {
    const auto parsed = pelloran::parseImportLine(line, kNow);
    EXPECT_FALSE(parsed) << line.substr(0, 80);
    EXPECT_FALSE(parsed.error().text.empty()) << line.substr(0, 80);
  }
}

}  // namespace
