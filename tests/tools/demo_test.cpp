#include <gtest/gtest.h>

#include "support/TestPlatform.h"
#include "tools/demo/Rules.h"
#include "tools/demo/Screen.h"

namespace {

using platform::Dictionary;

TEST(DemoRules, TellsOwnEntriesFromPrefixesAndTheLongestOfThem) {
  support::TestPlatform device;
  const Dictionary entries{{"a.b", Dictionary{{"sig_fig", 1}}}, {"a.b.c.d", Dictionary()}};
  const Dictionary prefixes{{"a.", Dictionary{{"bucket_interval", 10}, {"sig_fig", 2}}},
                            {"a.b.c", Dictionary()}};
  device.setWhitelist(
      {{"Group", Dictionary{{"ScalarKeys", entries}, {"ScalarKeyPrefixes", prefixes}}}});
  morvend::DeviceContext context(device.platform);
  const auto whitelist = report::PLConfig::init(device.platform, context);
  const demo::Rules rules(whitelist.get());
  const struct {
    const char *key, *prefix, *rounding;
  } kRows[] = {
      {"a.b", "own", "1 figure"},
      {"a.b.c.d", "own", "as it is"},
      {"a.b.c.de", "a.b.c", "as it is"},
      {"a.b.c", "a.b.c", "as it is"},
      {"a.bc", "a.", "nearest 10, 2 figures"},
      {"a.", "a.", "nearest 10, 2 figures"},
  };
  for (const auto& [key, prefix, rounding] : kRows) {
    const auto rule = rules.ofScalar(key);
    ASSERT_TRUE(rule) << key;
    EXPECT_EQ(rule->prefix.value_or("own"), prefix) << key;
    EXPECT_EQ(demo::roundingText(*rule->options), rounding) << key;
  }
  EXPECT_FALSE(rules.ofScalar("b"));
  EXPECT_FALSE(rules.ofDistribution("a.b"));
  EXPECT_FALSE(demo::Rules(nullptr).ofScalar("a.b"));
}

TEST(DemoScreen, KeepsToItsColumns) {
  EXPECT_EQ(demo::elided("abcdefghij", 10), "abcdefghij");
  EXPECT_EQ(demo::elided("abcdefghij", 7), "ab…ghij");
  EXPECT_EQ(demo::elided("äöüäöüäöüä", 4), "ä…üä");
  const std::pair<double, const char*> bars[] = {{-1, ""},     {0, ""},   {1e-9, "▏"}, {0.5, "█"},
                                                 {0.75, "█▌"}, {1, "██"}, {2, "██"}};
  for (const auto& [share, text] : bars) EXPECT_EQ(demo::bar(share, 2), text) << share;
  EXPECT_EQ(demo::skyline(std::vector<std::uint64_t>{0, 4, 8}), "▁▅█");
  EXPECT_EQ(demo::skyline({}), "");
  EXPECT_EQ(demo::evenlySpread(5, 2), (std::vector<std::size_t>{0, 2}));
  EXPECT_EQ(demo::evenlySpread(2, SIZE_MAX), (std::vector<std::size_t>{0, 1}));

  demo::Table table({{"KEY", demo::Table::Align::left}, {"N", demo::Table::Align::right}});
  table.addRow({std::string(200, 'k'), "12345"});
  table.addRow({"short", "1"});
  for (std::istringstream lines(table.text()); !lines.eof();) {
    std::string line;
    std::getline(lines, line);
    EXPECT_LE(line.size(), demo::screenWidth() + 2) << line;  // the ellipsis has three bytes
  }
}

}  // namespace
