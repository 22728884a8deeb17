// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/common/Table.h"

#include <libsmartcols/libsmartcols.h>

#include <algorithm>
#include <clocale>
#include <cstdlib>
#include <cwchar>
#include <memory>
#include <new>
#include <string_view>

#include "base/UTF8.h"
#include "tools/common/TerminalText.h"

namespace tools {

namespace {

// The library and the C library's widths take texts for what the thread's locale says: UTF-8, as
// long as this lives.
class UTF8Locale {
 public:
  UTF8Locale() {
    static const locale_t kUTF8 = ::newlocale(LC_CTYPE_MASK, "C.UTF-8", locale_t{});
    previous_ = ::uselocale(kUTF8);
  }
  ~UTF8Locale() { ::uselocale(previous_); }
  UTF8Locale(const UTF8Locale&) = delete;
  UTF8Locale& operator=(const UTF8Locale&) = delete;

 private:
  locale_t previous_;
};

struct Unref {
  void operator()(libscols_table* table) const { scols_unref_table(table); }
};
struct Free {
  void operator()(char* text) const { std::free(text); }
};

template <typename Pointer>
Pointer made(Pointer pointer) {
  return pointer != nullptr ? pointer : throw std::bad_alloc();
}

std::size_t columnsOf(char32_t character) {
  return static_cast<std::size_t>(std::max(::wcwidth(static_cast<wchar_t>(character)), 0));
}

// Both take printable text.

std::size_t columnsOf(std::string_view text) {
  std::size_t columns = 0;
  while (!text.empty()) {
    const auto [code, length] = base::firstCharacter(text);
    columns += columnsOf(code);
    text.remove_prefix(length);
  }
  return columns;
}

std::string_view cut(std::string_view line, std::size_t most) {
  std::size_t columns = 0, at = 0;
  while (at < line.size()) {
    const auto [code, length] = base::firstCharacter(line.substr(at));
    columns += columnsOf(code);
    if (columns > most) break;
    at += length;
  }
  return line.substr(0, at);
}

// Does `toLine` with each line of a text.
template <typename ToLine>
void forEachLine(std::string_view text, ToLine toLine) {
  while (!text.empty()) {
    const std::size_t end = std::min(text.find('\n'), text.size());
    toLine(text.substr(0, end));
    text.remove_prefix(std::min(end + 1, text.size()));
  }
}

}  // namespace

std::string Table::text(std::size_t most) const {
  const bool titled = std::ranges::any_of(columns_, [](const auto& c) { return !c.title.empty(); });
  if (rows_.empty() && !titled) return {};
  const UTF8Locale utf8;
  const std::unique_ptr<libscols_table, Unref> table(made(scols_new_table()));
  scols_table_set_column_separator(table.get(), "  ");
  scols_table_enable_noheadings(table.get(), !titled);
  scols_table_enable_noencoding(table.get(), true);  // what is printable, printable() says
  const bool wraps = std::ranges::any_of(columns_, &Column::wraps) && most != std::string::npos;
  scols_table_set_termforce(table.get(), wraps ? SCOLS_TERMFORCE_ALWAYS : SCOLS_TERMFORCE_NEVER);
  if (wraps) scols_table_set_termwidth(table.get(), std::max(most, indent_) - indent_);
  for (const auto& [title, align, itWraps] : columns_) {
    made(scols_table_new_column(
        table.get(), printable(title).c_str(), 0,
        (align == Align::right ? SCOLS_FL_RIGHT : 0) | (itWraps ? SCOLS_FL_WRAP : 0)));
  }
  for (const auto& row : rows_) {
    libscols_line* const line = made(scols_table_new_line(table.get(), nullptr));
    for (std::size_t i = 0; i < row.size(); ++i) {
      if (scols_line_set_data(line, i, printable(row[i]).c_str()) != 0) throw std::bad_alloc();
    }
  }
  char* printed = nullptr;
  if (scols_print_table_to_string(table.get(), &printed) != 0) throw std::bad_alloc();
  const std::unique_ptr<char, Free> owned(printed);
  std::string lines, line;
  forEachLine(printed, [&](std::string_view content) {
    line.assign(indent_, ' ').append(content);
    line.resize(line.find_last_not_of(' ') + 1);
    const bool fits = line.size() <= most || columnsOf(line) <= most;
    lines.append(fits ? line : cut(line, most - 1)).append(fits ? "\n" : "…\n");
  });
  return lines;
}

std::size_t Table::width() const {
  const UTF8Locale utf8;
  std::size_t widest = 0;
  forEachLine(text(), [&](std::string_view line) { widest = std::max(widest, columnsOf(line)); });
  return widest;
}

}  // namespace tools
