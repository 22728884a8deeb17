// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <utility>
#include <vector>

#include "base/Text.h"
#include "plist/PropertyList.h"

namespace plist {
namespace {

std::string document(std::string_view content) {
  return "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n<plist version=\"1.0\">" +
         std::string(content) + "</plist>\n";
}

Value nested(int depth) {
  Value value = Array();
  for (int i = 1; i < depth; ++i) value = Array{std::move(value)};
  return value;
}

TEST(PropertyListXML, ReadsEveryForm) {
  const double infinity = std::numeric_limits<double>::infinity();
  struct Row {
    const char* content;
    Value value;
  };
  for (const Row& row : {
           Row{"<true/>", true},
           Row{"<false></false>", false},
           Row{"<integer>-0</integer>", 0},
           Row{"<integer> +17\n</integer>", 17},
           Row{"<integer>0x7fFF</integer>", 0x7FFF},
           Row{"<integer>-0X10</integer>", -16},
           Row{"<integer>9223372036854775807</integer>", INT64_MAX},
           Row{"<integer>9223372036854775808</integer>", std::uint64_t{1} << 63},
           Row{"<integer>-9223372036854775808</integer>", INT64_MIN},
           Row{"<integer>18446744073709551615</integer>", UINT64_MAX},
           Row{"<real>.5</real>", 0.5},
           Row{"<real>+1.e3</real>", 1000.0},
           Row{"<real>-Infinity</real>", -infinity},
           Row{"<string/>", ""},
           Row{"<string> a&amp;&lt;&#65;&#x20AC;<!-- - --><![CDATA[<b>]]>\r\n</string>",
               " a&<A\xE2\x82\xAC<b>\n"},
           Row{"<date>2026-11-22T04:00:00Z</date>", Date{1795320000}},
           Row{"<date>-0001-12-31T23:59:59Z</date>", Date{-62167219201}},
           Row{"<date>12000-02-29T00:00:00Z</date>", Date{316521302400}},
           Row{"<data/>", Data{}},
           Row{"<data>\n\tAA EC\n\tAwQ=\n</data>", Data{0, 1, 2, 3, 4}},
           Row{"<array> <array/>\n<dict/> </array>", Array{Array{}, Dictionary{}}},
           Row{"<dict><key>a</key><integer>1</integer><key/><array/>"
               "<key>a</key><string>later</string></dict>",
               Dictionary{{"a", "later"}, {"", Array{}}}},
       }) {
    const base::Result<Value> result = read(document(row.content));
    ASSERT_TRUE(result) << row.content << ": " << result.error().text;
    EXPECT_TRUE(*result == row.value) << row.content << ": " << description(*result);
    EXPECT_EQ(result->variant().index(), row.value.variant().index()) << row.content;
  }
  EXPECT_EQ(read(document("<integer>5</integer>"))->as<Number>()->type(), Number::Type::int64);
  EXPECT_EQ(read(document("<true/>"))->as<Number>()->type(), Number::Type::boolean);
  EXPECT_TRUE(std::isnan(read(document("<real>NaN</real>"))->as<Number>()->doubleValue()));
}

TEST(PropertyListXML, RefusesEverythingElseAndSaysWhere) {
  // Contents that an element can't have.
  const std::pair<const char*, std::vector<const char*>> contents[] = {
      {"integer",
       {"", "-", "1.0", "0x", "+-1", "1 2", "0x1g", "18446744073709551616",
        "-9223372036854775809"}},
      {"real", {"", "1,5", "1e999", "+-1", "0x10", "1.5 m"}},
      {"date",
       {"", "2026-11-22", "2026-11-22T04:00:00", "2026-02-29T00:00:00Z", "2026-13-01T00:00:00Z",
        "2026-00-01T00:00:00Z", "2026-01-00T00:00:00Z", "2026-01-01T24:00:00Z",
        "2026-01-01T00:60:00Z", "2026-01-01T00:00:60Z", "026-01-01T00:00:00Z",
        "--026-01-01T00:00:00Z", "9999999-01-01T00:00:00Z", "12345678-01-01T00:00:00Z",
        "2026-01-01T-1:00:00Z"}},
      {"data",
       {"A", "AA", "AA=", "AA===", "AAA", "AB==", "AAB=", "AA==AAAA", "====", "AAAA====", "A*AA"}},
      {"string", {"&nbsp;", "&#0;", "&#1;", "&#xFFFE;", "\xEF\xBF\xBF", "\xFF", "<b/>"}},
      {"array", {"x", "<key>a</key>"}},
      {"dict",
       {"<true/>", "<key>a</key>", "<key>a</key>1<true/>", "<key>a</key><key>b</key><true/>",
        "<key>\x1F</key><true/>"}},
      {"true", {"x"}},
      {"key", {"a"}},
      {"plist", {"<true/>"}},
      {"set", {""}},
      {"arrays", {""}},
      {"stringstring", {"a"}}};
  std::vector<std::string> all = {"", "<true/><true/>", "x<true/>", "<string>a",
                                  "<array><true/></dict>"};
  for (const auto& [name, bad] : contents) {
    const std::string open = base::format("<%s>", name), close = base::format("</%s>", name);
    for (const std::string content : bad) all.push_back(open + content + close);
  }
  for (const std::string& bad : all) {
    const base::Result<Value> result = read(document(std::string("<!-- -->\n") + bad));
    EXPECT_FALSE(result) << bad;
    EXPECT_TRUE(result.error().text.starts_with("XML property list, line "))
        << bad << result.error().text;
  }
  EXPECT_EQ(read("<plist>\n <string>a</string>\n <sting/></plist>").error().text,
            "XML property list, line 3, column 2: the element is no property-list value");
  for (const char* whole : {"<dict/>", "<html><true/></html>", "plist", "<plist><true/></plist>x",
                            "<?xml version=\"1.0\" encoding=\"klingon\"?><plist><true/></plist>"}) {
    EXPECT_FALSE(read(whole)) << whole;
  }
}

TEST(PropertyListXML, IgnoresADoctypeButTakesNothingFromIt) {
  const std::string outside = "<!DOCTYPE plist SYSTEM \"file:///etc/passwd\">";
  EXPECT_EQ(*read(outside + "<plist><string>&lt;</string></plist>"), Value("<"));
  for (const std::string& hostile : {
           outside + "<plist><string>&outside;</string></plist>",
           outside + "<plist>&outside;<true/></plist>",
           std::string("<!DOCTYPE plist []><plist><true/></plist>"),
           std::string("<!DOCTYPE plist [<!ENTITY a \"b\">]><plist><string>&a;</string></plist>"),
           std::string("<!DOCTYPE plist [<!ENTITY % p SYSTEM \"/dev/zero\"> %p;]><plist/>"),
       }) {
    EXPECT_FALSE(read(hostile)) << hostile;
  }
}

TEST(PropertyListXML, ReadsOtherEncodings) {
  std::string wide = "\xFF\xFE";
  for (const char c : std::string("<plist><string>\xE4</string></plist>")) wide += {c, '\0'};
  EXPECT_EQ(*read(wide), Value("\xC3\xA4"));
  EXPECT_EQ(*read("<?xml version=\"1.0\" encoding=\"ISO-8859-1\"?>"
                  "<plist><string>\xE4</string></plist>"),
            Value("\xC3\xA4"));
}

TEST(PropertyListXML, DepthIsLimitedBothWays) {
  const auto deep = [](int depth) {
    std::string content;
    for (int i = 0; i < depth; ++i) content += "<array>";
    for (int i = 0; i < depth; ++i) content += "</array>";
    return document(content);
  };
  EXPECT_TRUE(read(deep(kMaxDepth)));
  EXPECT_FALSE(read(deep(kMaxDepth + 1)));
  EXPECT_FALSE(read(deep(500000)));
  EXPECT_EQ(*read(*writeXML(nested(kMaxDepth))), nested(kMaxDepth));
  EXPECT_FALSE(writeXML(nested(kMaxDepth + 1)));
}

TEST(PropertyListXML, ValuesAreBoundedByTheMemoryThatTheyTake) {
  const auto list = [](std::size_t count, std::string_view value) {
    std::string xml = "<plist><array>";
    for (std::size_t i = 0; i < count; ++i) xml += value;
    return read(xml + "</array></plist>");
  };
  EXPECT_TRUE(list(kMaxValues, "<true/>"));
  for (const auto& [count, value] : {std::pair<std::size_t, const char*>{kMaxValues + 1, "<true/>"},
                                     {600'000, "<array><true/></array>"}}) {
    const auto refused = list(count, value);
    EXPECT_TRUE(!refused && refused.error().text.ends_with("too many values")) << value;
  }
}

TEST(PropertyListXML, ACutDocumentIsNeverAValue) {
  const std::string whole = *writeXML(Dictionary{{"a", Array{1, "\xE2\x82\xAC", Data{1}}}});
  for (std::size_t length = 0; length + 1 < whole.size(); ++length) {
    EXPECT_FALSE(read(std::string_view(whole).substr(0, length))) << length;
  }
}

TEST(PropertyListXML, WritesThisAndNothingElse) {
  const Value value = Dictionary{
      {"z", Array{}},
      {"a&b", Dictionary{}},
      {"list", Array{std::uint64_t{1} << 63, -1, 0.1, 100.0, -0.0, -NAN, 0.5f, true, false,
                     Date{0.9}, Data{0, 1, 2, 3}, std::string("<\r\n\t\0\xFF>", 7)}},
  };
  EXPECT_EQ(*writeXML(value),
            "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n"
            "<plist version=\"1.0\">\n"
            "<dict>\n"
            "\t<key>z</key>\n"
            "\t<array/>\n"
            "\t<key>a&amp;b</key>\n"
            "\t<dict/>\n"
            "\t<key>list</key>\n"
            "\t<array>\n"
            "\t\t<integer>9223372036854775808</integer>\n"
            "\t\t<integer>-1</integer>\n"
            "\t\t<real>0.1</real>\n"
            "\t\t<real>100</real>\n"
            "\t\t<real>-0</real>\n"
            "\t\t<real>nan</real>\n"
            "\t\t<real>0.5</real>\n"
            "\t\t<true/>\n"
            "\t\t<false/>\n"
            "\t\t<date>1970-01-01T00:00:00Z</date>\n"
            "\t\t<data>AAECAw==</data>\n"
            "\t\t<string>&lt;&#13;\n\t\xEF\xBF\xBD\xEF\xBF\xBD&gt;</string>\n"
            "\t</array>\n"
            "</dict>\n"
            "</plist>\n");
}

// A key alone, and beside one that becomes the same: the later counts.
TEST(PropertyListXML, WhatCantBeTextIsReplaced) {
  const std::string r = "\xEF\xBF\xBD";
  struct Row {
    const char* bytes;
    std::string text;
  };
  for (const Row& row : {
           Row{"\x01\x1F\x7F", r + r + "\x7F"},
           Row{"\x80\xC0\xAF\xC3", r + r + r + r},
           Row{"\xE0\x9F\xBF", r + r + r},
           Row{"\xED\xA0\x80", r + r + r},
           Row{"\xEF\xBF\xBE\xEF\xBF\xBF", r + r},
           Row{"eight bytes, and then\x1F", "eight bytes, and then" + r},
           Row{"\xF0\x8F\xBF\xBF", r + r + r + r},
           Row{"\xF4\x90\x80\x80", r + r + r + r},
           Row{"\xE2\x82z", r + r + "z"},
           Row{"\xF4\x8F\xBF\xBF\xF0\x90\x80\x80\xEE\x80\x80\xED\x9F\xBF\xDF\xBF\xE0\xA0\x80",
               "\xF4\x8F\xBF\xBF\xF0\x90\x80\x80\xEE\x80\x80\xED\x9F\xBF\xDF\xBF\xE0\xA0\x80"},
       }) {
    EXPECT_EQ(*read(*writeXML(row.bytes)), Value(row.text)) << row.text;
    EXPECT_EQ(*writeXML(Dictionary{{row.bytes, 1}, {row.text, 2}}),
              *writeXML(Dictionary{{row.text, 2}}));
  }
}

TEST(PropertyListXML, AwkwardValuesComeBackEqual) {
  using Limits = std::numeric_limits<double>;
  const std::string awkward = " ]]>&amp;&#13;<!--\r\n\t\x7F\xC2\x85\xF0\x9F\x98\x80\"\\ ";
  const Value value = Dictionary{
      {awkward, awkward},
      {"numbers", Array{INT64_MIN, UINT64_MAX, -0.0, Limits::max(), Limits::denorm_min(), 1e16,
                        0x1p63, 0.1f, 1.0 / 7, -Limits::infinity()}},
      {"dates", Array{Date{-3e13}, Date{-62167219201}, Date{-1}, Date{951782400}, Date{3e13}}},
      {"data", Array{Data{}, Data{255}, Data{1, 254}, Data(100, 77)}}};
  const std::string text = *writeXML(value);
  const base::Result<Value> again = read(text);
  ASSERT_TRUE(again) << again.error().text << "\n" << text;
  EXPECT_TRUE(*again == value) << text;
  EXPECT_EQ(*writeXML(*again), text);
}

TEST(PropertyListCodec, RefusesNothingAndTooMuch) {
  EXPECT_EQ(read("").error().text, "the property list is empty");
  const std::string tooMuch(kMaxSize + 1, ' ');
  EXPECT_EQ(read(tooMuch).error().text, "the property list has 16777217 bytes, more than 16777216");
}

}  // namespace
}  // namespace plist
