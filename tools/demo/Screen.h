// Text for people: tables, bars and headings, as wide as the terminal.
#pragma once

#include <cstdint>
#include <span>
#include <string>
#include <string_view>
#include <vector>

namespace demo {

// The columns of the terminal that standard output is; 80 where it is none.
std::size_t screenWidth();

// A line that begins a section; bold on a terminal.
std::string heading(std::string_view text);

// Cuts the middle out of a text that is wider than `width` columns.
std::string elided(std::string_view text, std::size_t width);

// A key without the beginning that nearly all have: "~" stands for "com.norba".
std::string shortKey(std::string_view key);

// Names one after the other, in indented lines.
std::string wrapped(const std::vector<std::string>& names);

// A bar for a share of 1, `width` columns long for all of it, in steps of an eighth of a column.
// What is more than nothing is seen.
std::string bar(double share, std::size_t width);

// One block for each count, as high as its share of the largest.
std::string skyline(std::span<const std::uint64_t> counts);

// Up to `most` indices below `count`, evenly spread, ascending.
std::vector<std::size_t> evenlySpread(std::size_t count, std::size_t most);

// Rows in columns. The first column gives way when the screen is too narrow for all.
class Table {
 public:
  enum class Align { left, right };
  struct Column {
    const char* title;
    Align align;
  };

  explicit Table(std::vector<Column> columns);

  void addRow(std::vector<std::string> cells) { rows_.push_back(std::move(cells)); }

  // The lines, each indented and ended; with the titles unless all of them are empty.
  std::string text() const;

 private:
  std::vector<Column> columns_;
  std::vector<std::vector<std::string>> rows_;
};

}  // namespace demo
