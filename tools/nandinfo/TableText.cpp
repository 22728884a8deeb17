// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/nandinfo/TableText.h"

#include <algorithm>
#include <span>
#include <unordered_set>
#include <utility>
#include <vector>

#include "base/Text.h"
#include "base/Timestamp.h"
#include "plist/JSON.h"
#include "tools/common/Table.h"
#include "tools/common/TerminalText.h"

namespace nandinfo {

namespace {

using plist::Array;
using plist::Dictionary;
using plist::Number;
using plist::Value;
using tools::printable;

struct Cell {
  std::string text;
  bool right = false;
};
using Row = std::vector<Cell>;

// A number's text with its whole part in groups of three.
std::string grouped(std::string text) {
  const std::size_t first = text.starts_with('-') ? 1 : 0;
  std::size_t end = std::min(text.find_first_not_of("0123456789", first), text.size());
  while (end > first + 3) text.insert(end -= 3, ",");
  return text;
}

Cell cellOf(const Value& value) {
  if (const auto* number = value.as<Number>()) {
    if (number->type() == Number::Type::boolean) return {number->boolValue() ? "true" : "false"};
    return {grouped(number->text()), true};
  }
  if (const auto* text = value.as<std::string>()) return {*text};
  if (const auto* date = value.as<plist::Date>()) {
    Cell cell;
    base::appendTimestamp(cell.text, date->secondsSince1970);
    return cell;
  }
  Cell json;
  plist::appendJSON(json.text, value);
  return json;
}

// The table of the rows. Numbers end below each other, however wide the texts among them are.
tools::Table tableOf(std::vector<Row> rows) {
  std::vector<std::size_t> numbers;  // how wide those of each column are
  for (const Row& row : rows) {
    numbers.resize(std::max(numbers.size(), row.size()));
    for (std::size_t i = 0; i < row.size(); ++i) {
      if (row[i].right) numbers[i] = std::max(numbers[i], row[i].text.size());
    }
  }
  tools::Table table{std::vector<tools::Table::Column>(numbers.size())};
  for (Row& row : rows) {
    std::vector<std::string> cells;
    for (std::size_t i = 0; i < row.size(); ++i) {
      auto& [text, right] = row[i];
      if (right) text.insert(0, numbers[i] - text.size(), ' ');
      cells.push_back(std::move(text));
    }
    table.addRow(std::move(cells));
  }
  return table;
}

template <typename Content>
bool holdsOnly(const Array& array) {
  return std::ranges::all_of(array,
                             [](const Value& value) { return value.as<Content>() != nullptr; });
}

std::vector<std::string_view> keysOf(const std::vector<const Dictionary*>& dictionaries) {
  std::vector<std::string_view> keys;
  std::unordered_set<std::string_view> known;
  for (const Dictionary* dictionary : dictionaries) {
    for (const auto& [key, value] : *dictionary) {
      if (known.insert(key).second) keys.push_back(key);
    }
  }
  return keys;
}

Cell cellOf(const Dictionary& dictionary, std::string_view key) {
  const Value* value = dictionary.find(key);
  return value != nullptr ? cellOf(*value) : Cell{};
}

// A row for each dictionary under its keys.
void appendRecords(std::string& out, const Array& array, std::size_t width) {
  std::vector<const Dictionary*> records;
  for (const Value& value : array) records.push_back(value.as<Dictionary>());
  const auto keys = keysOf(records);
  std::vector<Row> rows(1);
  for (const auto key : keys) rows.front().push_back({std::string(key)});
  for (const Dictionary* record : records) {
    Row& row = rows.emplace_back();
    for (const auto key : keys) row.push_back(cellOf(*record, key));
  }
  out += tableOf(std::move(rows)).text(width);
}

// Eight numbers to a row, after the index of the first.
void appendNumbers(std::string& out, const Array& array) {
  std::vector<Row> rows;
  for (std::size_t i = 0; i < array.size();) {
    Row& row = rows.emplace_back(1, Cell{std::to_string(i) + ":", true});
    for (std::size_t end = std::min(array.size(), i + 8); i < end; ++i) {
      row.push_back(cellOf(array[i]));
    }
  }
  out += tableOf(std::move(rows)).text();
}

void appendArray(std::string& out, const Array& array, std::size_t width) {
  if (array.empty()) return;
  if (holdsOnly<Dictionary>(array)) return appendRecords(out, array, width);
  if (holdsOnly<Number>(array)) return appendNumbers(out, array);
  std::vector<Row> rows;
  for (const Value& value : array) {
    Row& row = rows.emplace_back();
    if (const Array* cells = value.as<Array>()) {
      for (const Value& cell : *cells) row.push_back(cellOf(cell));
    } else {
      row.push_back(cellOf(value));
    }
  }
  out += tableOf(std::move(rows)).text();
}

struct Nested {
  std::string title;
  const Dictionary* dictionary;
};

// A column for each dictionary; a lone one has no title.
tools::Table sideBySide(std::span<const Nested> columns) {
  std::vector<const Dictionary*> dictionaries;
  Row titles(1);
  for (const auto& [title, dictionary] : columns) {
    dictionaries.push_back(dictionary);
    titles.push_back({title, true});
  }
  std::vector<Row> rows;
  if (columns.size() > 1) rows.push_back(std::move(titles));
  for (const auto key : keysOf(dictionaries)) {
    Row& row = rows.emplace_back(1, Cell{std::string(key)});
    for (const Dictionary* dictionary : dictionaries) row.push_back(cellOf(*dictionary, key));
  }
  return tableOf(std::move(rows));
}

// As many as `width` allows side by side, then the next ones.
void appendNested(std::string& out, std::span<const Nested> rest, std::size_t width) {
  while (!rest.empty()) {
    std::size_t count = 1;
    tools::Table table = sideBySide(rest.first(1));
    while (count < rest.size()) {
      tools::Table wider = sideBySide(rest.first(count + 1));
      if (wider.width() > width) break;
      table = std::move(wider);
      ++count;
    }
    if (!out.empty()) out += '\n';
    if (count == 1) out += rest.front().title + ":\n";
    out += table.text();
    rest = rest.subspan(count);
  }
}

// Whether every value is shown in one cell.
bool isFlat(const Dictionary& dictionary) {
  return std::ranges::all_of(dictionary, [](const Dictionary::Entry& entry) {
    const auto* array = entry.value.as<Array>();
    return entry.value.as<Dictionary>() == nullptr && (array == nullptr || array->empty());
  });
}

// `title` names what the dictionary is a part of, for the titles of its own parts.
void appendDictionary(std::string& out, const Dictionary& dictionary, std::size_t width,
                      const std::string& title = {}) {
  std::vector<Row> scalars;
  std::vector<Nested> nested, deeper;
  std::vector<std::pair<std::string, const Array*>> arrays;
  for (const auto& [key, value] : dictionary) {
    if (const auto* inner = value.as<Dictionary>()) {
      (isFlat(*inner) ? nested : deeper).push_back({printable(key), inner});
    } else if (const auto* array = value.as<Array>(); array != nullptr && !array->empty()) {
      arrays.emplace_back(printable(key), array);
    } else {
      scalars.push_back({{key}, cellOf(value)});
    }
  }
  out += tableOf(std::move(scalars)).text();
  appendNested(out, nested, width);
  for (const auto& [key, array] : arrays) {
    if (!out.empty()) out += '\n';
    out += key + ":\n";
    appendArray(out, *array, width);
  }
  for (const auto& [key, inner] : deeper) {
    if (!out.empty()) out += '\n';
    out += title + key + ":\n";
    appendDictionary(out, *inner, width, title + key + ", ");
  }
}

}  // namespace

std::string tableText(const Value& value, std::size_t width) {
  std::string out;
  if (const auto* dictionary = value.as<Dictionary>()) {
    appendDictionary(out, *dictionary, width);
  } else if (const auto* array = value.as<Array>()) {
    appendArray(out, *array, width);
  } else {
    out = printable(cellOf(value).text) + '\n';
  }
  return out;
}

}  // namespace nandinfo
