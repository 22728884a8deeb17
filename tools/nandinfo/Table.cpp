#include "tools/nandinfo/Table.h"

#include <algorithm>
#include <unordered_set>
#include <vector>

#include "platform/Text.h"
#include "platform/host/JSON.h"
#include "platform/host/UTF8.h"

namespace nandinfo {

namespace {

using platform::Array;
using platform::Dictionary;
using platform::Number;
using platform::Value;

struct Cell {
  std::string text;
  bool right = false;
};
using Row = std::vector<Cell>;

bool continues(char byte) { return (static_cast<unsigned char>(byte) & 0xc0) == 0x80; }

std::size_t columnsOf(std::string_view text) {
  return text.size() - static_cast<std::size_t>(std::count_if(text.begin(), text.end(), continues));
}

std::string grouped(std::string digits) {
  const std::size_t first = digits.starts_with('-') ? 1 : 0;
  for (std::size_t i = digits.size(); i > first + 3;) digits.insert(i -= 3, ",");
  return digits;
}

Cell cellOf(const Value& value) {
  if (const auto* number = value.as<Number>()) {
    if (number->type() == Number::Type::boolean) return {number->boolValue() ? "true" : "false"};
    return {number->isReal() ? number->text() : grouped(number->text()), true};
  }
  if (const auto* text = value.as<std::string>()) return {printable(*text)};
  std::string json;
  platform::host::appendJSON(json, value);
  return {printable(json)};
}

// Rows in columns, two blanks apart.
class Grid {
 public:
  void add(Row row) { rows_.push_back(std::move(row)); }

  std::size_t width() const {
    std::size_t width = 0;
    for (const std::size_t column : widths()) width += column + (width > 0 ? 2 : 0);
    return width;
  }

  // Lines wider than `most` columns are cut.
  void appendTo(std::string& out, std::size_t most = std::string::npos) const {
    const auto columns = widths();
    for (const Row& row : rows_) {
      std::string line;
      for (std::size_t i = 0; i < row.size(); ++i) {
        const std::string blanks(columns[i] - columnsOf(row[i].text), ' ');
        if (i > 0) line += "  ";
        line += row[i].right ? blanks + row[i].text : row[i].text + blanks;
      }
      line.resize(line.find_last_not_of(' ') + 1);
      if (columnsOf(line) > most) cut(line, most);
      out += line + '\n';
    }
  }

 private:
  static void cut(std::string& line, std::size_t most) {
    std::size_t end = 0;
    for (std::size_t columns = 0; end < line.size(); ++end) {
      if (!continues(line[end]) && columns++ == most - 1) break;
    }
    line.resize(end);
    line += "\xE2\x80\xA6";  // an ellipsis
  }

  std::vector<std::size_t> widths() const {
    std::vector<std::size_t> widths;
    for (const Row& row : rows_) {
      widths.resize(std::max(widths.size(), row.size()));
      for (std::size_t i = 0; i < row.size(); ++i) {
        widths[i] = std::max(widths[i], columnsOf(row[i].text));
      }
    }
    return widths;
  }

  std::vector<Row> rows_;
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

void appendHeading(std::string& out, std::string_view key) {
  if (!out.empty()) out += '\n';
  out += printable(key) + ":\n";
}

void appendDictionary(std::string& out, const Dictionary& dictionary, std::size_t width) {
  Grid scalars;
  std::vector<const Dictionary*> nested;
  Row titles(1);
  for (const auto& [key, value] : dictionary) {
    if (const auto* inner = value.as<Dictionary>()) {
      nested.push_back(inner);
      titles.push_back({printable(key), true});
    } else if (const auto* array = value.as<Array>(); array == nullptr || array->empty()) {
      scalars.add({{printable(key)}, cellOf(value)});
    }
  }
  scalars.appendTo(out);
  Grid sideBySide;
  sideBySide.add(titles);
  for (const auto key : keysOf(nested)) {
    Row row{{printable(key)}};
    for (const Dictionary* inner : nested) row.push_back(cellOf(*inner, key));
    sideBySide.add(std::move(row));
  }
  const bool fits = nested.size() > 1 && sideBySide.width() <= width;
  if (fits) {
    if (!out.empty()) out += '\n';
    sideBySide.appendTo(out);
  }
  for (const auto& [key, value] : dictionary) {
    if (const auto* inner = value.as<Dictionary>(); inner != nullptr && !fits) {
      appendHeading(out, key);
      Grid grid;
      for (const auto& entry : *inner) grid.add({{printable(entry.key)}, cellOf(entry.value)});
      grid.appendTo(out);
    } else if (const auto* array = value.as<Array>(); array != nullptr && !array->empty()) {
      appendHeading(out, key);
      appendArray(out, *array, width);
    }
  }
}

}  // namespace

std::string printable(std::string_view text) {
  static constexpr platform::host::EscapedCharacters kControls("", "\x7f");
  std::string shown;
  platform::host::appendEscaped(shown, text, kControls, [](std::string& to, char) { to += '?'; });
  // The control characters beyond ASCII, which some terminals obey.
  for (std::size_t i = 0; (i = shown.find('\xC2', i)) != std::string::npos; ++i) {
    if (static_cast<unsigned char>(shown[i + 1]) < 0xA0) shown.replace(i, 2, "?");
  }
  return shown;
}

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
