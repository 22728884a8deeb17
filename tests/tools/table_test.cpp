// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include <gtest/gtest.h>

#include "tools/common/Table.h"

namespace {

using tools::Table;

// The screen that is too narrow: a column wraps, what no column saves is cut and says so.
TEST(ToolsTable, KeepsToTheColumnsThatItMayTake) {
  Table table({{"KEY", Table::Align::left, true}, {"N", Table::Align::right}, {}}, 2);
  table.addRow({"abcdefgh", "1,000", "x"});
  table.addRow({"日本\x1b", "7"});
  table.addRow({});
  EXPECT_EQ(table.width(), 20u);
  const std::string whole = "  KEY           N\n  abcdefgh  1,000  x\n  日本?         7\n\n";
  const std::pair<std::size_t, std::string> rows[] = {
      {std::string::npos, whole},
      {20, whole},
      {17, "  KEY        N\n  abcde  1,000  x\n  fgh\n  日本?      7\n\n"},
      {14, "  KEY      N\n  abc  1,000 …\n  def\n  gh\n  日       7\n  本?\n\n"},
      {1, "…\n…\n…\n…\n…\n…\n\n"},
  };
  for (const auto& [most, text] : rows) EXPECT_EQ(table.text(most), text) << most;
  EXPECT_EQ(Table({{"A"}, {"B"}}).text(), "");
}

}  // namespace
