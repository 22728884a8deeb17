// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "plist/JSON.h"

#include <algorithm>
#include <cmath>
#include <variant>

#include "base/Text.h"
#include "base/Timestamp.h"
#include "base/UTF8.h"
#include "plist/Base64.h"
#include "plist/WritableKeys.h"

namespace plist {

namespace {

constexpr base::EscapedCharacters kEscaped("", "\"\\");

void append(std::string& out, const std::string& text) {
  out += '"';
  base::appendEscaped(out, text, kEscaped, [](std::string& to, char c) {
    switch (c) {
      case '"':
      case '\\':
        to += '\\';
        to += c;
        break;
      case '\n':
        to += "\\n";
        break;
      case '\r':
        to += "\\r";
        break;
      case '\t':
        to += "\\t";
        break;
      default:
        to += base::format("\\u%04x", static_cast<unsigned>(c));
    }
  });
  out += '"';
}

void append(std::string& out, const Number& number) {
  if (number.type() == Number::Type::boolean) {
    out += number.boolValue() ? "true" : "false";
  } else if (number.type() == Number::Type::uint64) {
    base::appendInteger(out, number.uint64Value());
  } else if (!number.isReal()) {
    base::appendInteger(out, number.int64Value());
  } else if (!std::isfinite(number.doubleValue())) {
    out += "null";
  } else {
    const std::size_t begin = out.size();
    base::appendReal(out, number.doubleValue());
    if (out.find_first_of(".e", begin) == std::string::npos) out += ".0";
  }
}

void append(std::string& out, const Array& array) {
  out += '[';
  for (const Value& element : array) {
    if (&element != array.data()) out += ", ";
    appendJSON(out, element);
  }
  out += ']';
}

void append(std::string& out, const Dictionary& dictionary) {
  if (const auto written = withWritableKeys(dictionary)) return append(out, *written);
  out += '{';
  for (const Dictionary::Entry& entry : dictionary) {
    if (&entry != dictionary.begin()) out += ", ";
    append(out, entry.key);
    out += ": ";
    appendJSON(out, entry.value);
  }
  out += '}';
}

void append(std::string& out, const Date& date) {
  out += '"';
  base::appendTimestamp(out, date.secondsSince1970);
  out += '"';
}

void append(std::string& out, const Data& data) {
  out += '"';
  appendBase64(out, data);
  out += '"';
}

bool holdsOthers(const Array& array) {
  return std::any_of(array.begin(), array.end(), [](const Value& element) {
    return element.as<Array>() != nullptr || element.as<Dictionary>() != nullptr;
  });
}

void appendIndented(std::string& out, const Value& value, std::size_t depth) {
  const auto newLine = [&](std::size_t level) { out.append(1, '\n').append(2 * level, ' '); };
  if (const auto* dictionary = value.as<Dictionary>();
      dictionary != nullptr && !dictionary->empty()) {
    if (const auto written = withWritableKeys(*dictionary)) {
      return appendIndented(out, Value(*written), depth);
    }
    out += '{';
    for (const Dictionary::Entry& entry : *dictionary) {
      if (&entry != dictionary->begin()) out += ',';
      newLine(depth + 1);
      append(out, entry.key);
      out += ": ";
      appendIndented(out, entry.value, depth + 1);
    }
    newLine(depth);
    out += '}';
  } else if (const auto* array = value.as<Array>(); array != nullptr && holdsOthers(*array)) {
    out += '[';
    for (const Value& element : *array) {
      if (&element != array->data()) out += ',';
      newLine(depth + 1);
      appendIndented(out, element, depth + 1);
    }
    newLine(depth);
    out += ']';
  } else {
    appendJSON(out, value);
  }
}

}  // namespace

void appendJSON(std::string& out, const Value& value) {
  std::visit([&out](const auto& content) { append(out, content); }, value.variant());
}

void appendIndentedJSON(std::string& out, const Value& value) { appendIndented(out, value, 0); }

}  // namespace plist
