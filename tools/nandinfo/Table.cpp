#include "tools/nandinfo/Table.h"

#include <algorithm>
#include <span>
#include <unordered_set>
#include <utility>
#include <vector>

#include "base/Text.h"
#include "base/Timestamp.h"
#include "plist/JSON.h"
#include "tools/common/TerminalText.h"

namespace nandinfo {

namespace {

using plist::Array;
using plist::Dictionary;
using plist::Number;
using plist::Value;
using tools::columnsOf;
using tools::cutToColumns;
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
  if (const auto* text = value.as<std::string>()) return {printable(*text)};
  if (const auto* date = value.as<plist::Date>()) {
    Cell cell;
    base::appendTimestamp(cell.text, date->secondsSince1970);
    return cell;
  }
  std::string json;
  plist::appendJSON(json, value);
  return {printable(json)};
}

// Rows in columns, two blanks apart. Numbers end below each other, however wide the texts among
// them are.
class Grid {
 public:
  void add(Row row) {
    columns_.resize(std::max(columns_.size(), row.size()));
    for (std::size_t i = 0; i < row.size(); ++i) {
      const std::size_t width = columnsOf(row[i].text);
      columns_[i].width = std::max(columns_[i].width, width);
      if (row[i].right) columns_[i].numbers = std::max(columns_[i].numbers, width);
    }
    rows_.push_back(std::move(row));
  }

  std::size_t width() const {
    std::size_t width = 0;
    for (const Column& column : columns_) width += column.width + (width > 0 ? 2 : 0);
    return width;
  }

  // Lines wider than `most` columns are cut.
  void appendTo(std::string& out, std::size_t most = std::string::npos) const {
    for (const Row& row : rows_) {
      std::string line;
      std::size_t end = 0;  // of the columns so far
      for (std::size_t i = 0; i < row.size(); ++i) {
        const auto& [text, right] = row[i];
        if (right) line.append(columns_[i].numbers - columnsOf(text), ' ');
        line += text;
        end += columns_[i].width + 2;
        line.append(end - columnsOf(line), ' ');
      }
      line.resize(line.find_last_not_of(' ') + 1);
      out += cutToColumns(std::move(line), most) + '\n';
    }
  }

 private:
  struct Column {
    std::size_t width = 0, numbers = 0;  // of all cells, of the numbers among them
  };

  std::vector<Row> rows_;
  std::vector<Column> columns_;
};

template <typename Content>
bool holdsOnly(const Array& array) {
  return std::all_of(array.begin(), array.end(),
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
  Grid grid;
  Row titles;
  for (const auto key : keys) titles.push_back({printable(key)});
  grid.add(titles);
  for (const Dictionary* record : records) {
    Row row;
    for (const auto key : keys) row.push_back(cellOf(*record, key));
    grid.add(std::move(row));
  }
  grid.appendTo(out, width);
}

// Eight numbers to a row, after the index of the first.
void appendNumbers(std::string& out, const Array& array) {
  Grid grid;
  for (std::size_t i = 0; i < array.size();) {
    Row row{{std::to_string(i) + ":", true}};
    for (std::size_t end = std::min(array.size(), i + 8); i < end; ++i) {
      row.push_back(cellOf(array[i]));
    }
    grid.add(std::move(row));
  }
  grid.appendTo(out);
}

void appendArray(std::string& out, const Array& array, std::size_t width) {
  if (array.empty()) return;
  if (holdsOnly<Dictionary>(array)) return appendRecords(out, array, width);
  if (holdsOnly<Number>(array)) return appendNumbers(out, array);
  Grid grid;
  for (const Value& value : array) {
    Row row;
    if (const Array* cells = value.as<Array>()) {
      for (const Value& cell : *cells) row.push_back(cellOf(cell));
    } else {
      row.push_back(cellOf(value));
    }
    grid.add(std::move(row));
  }
  grid.appendTo(out);
}

struct Nested {
  std::string title;
  const Dictionary* dictionary;
};

// A column for each dictionary; a lone one has no title.
Grid sideBySide(std::span<const Nested> columns) {
  std::vector<const Dictionary*> dictionaries;
  Row titles(1);
  for (const auto& [title, dictionary] : columns) {
    dictionaries.push_back(dictionary);
    titles.push_back({title, true});
  }
  Grid grid;
  if (columns.size() > 1) grid.add(std::move(titles));
  for (const auto key : keysOf(dictionaries)) {
    Row row{{printable(key)}};
    for (const Dictionary* dictionary : dictionaries) row.push_back(cellOf(*dictionary, key));
    grid.add(std::move(row));
  }
  return grid;
}

// As many as `width` allows side by side, then the next ones.
void appendNested(std::string& out, std::span<const Nested> rest, std::size_t width) {
  while (!rest.empty()) {
    std::size_t count = 1;
    Grid grid = sideBySide(rest.first(1));
    while (count < rest.size()) {
      Grid wider = sideBySide(rest.first(count + 1));
      if (wider.width() > width) break;
      grid = std::move(wider);
      ++count;
    }
    if (!out.empty()) out += '\n';
    if (count == 1) out += rest.front().title + ":\n";
    grid.appendTo(out);
    rest = rest.subspan(count);
  }
}

// Whether every value is shown in one cell.
bool isFlat(const Dictionary& dictionary) {
  return std::all_of(dictionary.begin(), dictionary.end(), [](const Dictionary::Entry& entry) {
    const auto* array = entry.value.as<Array>();
    return entry.value.as<Dictionary>() == nullptr && (array == nullptr || array->empty());
  });
}

// `title` names what the dictionary is a part of, for the titles of its own parts.
void appendDictionary(std::string& out, const Dictionary& dictionary, std::size_t width,
                      const std::string& title = {}) {
  Grid scalars;
  std::vector<Nested> nested, deeper;
  std::vector<std::pair<std::string, const Array*>> arrays;
  for (const auto& [key, value] : dictionary) {
    if (const auto* inner = value.as<Dictionary>()) {
      (isFlat(*inner) ? nested : deeper).push_back({printable(key), inner});
    } else if (const auto* array = value.as<Array>(); array != nullptr && !array->empty()) {
      arrays.emplace_back(printable(key), array);
    } else {
      scalars.add({{printable(key)}, cellOf(value)});
    }
  }
  scalars.appendTo(out);
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
    out = cellOf(value).text + '\n';
  }
  return out;
}

}  // namespace nandinfo
