// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Tables for people, laid out by libsmartcols.
#pragma once

#include <cstddef>
#include <string>
#include <utility>
#include <vector>

namespace tools {

// Rows in columns, two blanks apart. Texts from elsewhere may be added as they are: cells and
// titles are made printable when they are shown.
class Table {
 public:
  enum class Align { left, right };
  struct Column {
    std::string title = {};
    Align align = Align::left;
    bool wraps = false;  // goes on in the next line where the table would be too wide
  };

  explicit Table(std::vector<Column> columns, std::size_t indent = 0)
      : columns_(std::move(columns)), indent_(indent) {}

  // As many cells as there are columns, or fewer.
  void addRow(std::vector<std::string> cells) { rows_.push_back(std::move(cells)); }

  // The lines, each ended; the first one has the titles unless all of them are empty. Where columns
  // that wrap can't keep them to `most` columns of the terminal, at least one, the lines are cut;
  // "…" stands for what is cut.
  std::string text(std::size_t most = std::string::npos) const;

  // The columns of the terminal that the whole table takes.
  std::size_t width() const;

 private:
  std::vector<Column> columns_;
  std::size_t indent_;  // blanks before each line
  std::vector<std::vector<std::string>> rows_;
};

}  // namespace tools
