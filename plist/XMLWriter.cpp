// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "plist/XMLWriter.h"

#include <algorithm>
#include <array>
#include <cstring>
#include <optional>
#include <variant>

#include "base/Text.h"
#include "base/Timestamp.h"
#include "base/UTF8.h"
#include "plist/Base64.h"
#include "plist/WritableKeys.h"

namespace plist {

namespace {

// A reader turns a bare carriage return into a line feed.
constexpr base::EscapedCharacters kEscaped("\t\n", "\r&<>");

void appendText(std::string& out, std::string_view text) {
  base::appendEscaped(out, text, kEscaped, [](std::string& to, char c) {
    switch (c) {
      case '&':
        to += "&amp;";
        break;
      case '<':
        to += "&lt;";
        break;
      case '>':
        to += "&gt;";
        break;
      case '\r':
        to += "&#13;";
        break;
      default:
        to += base::kReplacementCharacter;
    }
  });
}

// About the length of what will be written, for one reservation instead of many: texts as they are,
// tags and indentation by their usual lengths.
std::size_t estimatedLength(const Value& value) {
  constexpr std::size_t kElement = 32, kKey = 20;
  std::size_t length = kElement;
  if (const auto* text = value.as<std::string>()) {
    length += text->size();
  } else if (const auto* array = value.as<Array>()) {
    for (const Value& element : *array) length += estimatedLength(element);
  } else if (const auto* dictionary = value.as<Dictionary>()) {
    for (const Dictionary::Entry& entry : *dictionary) {
      length += kKey + entry.key.size() + estimatedLength(entry.value);
    }
  } else if (const auto* data = value.as<Data>()) {
    length += data->size() / 3 * 4;
  }
  return length;
}

// Composes the text in a block, which is small enough to stay in the processor's cache and has room
// for a whole element, so that most pieces cost no more than their copying.
class Writer {
 public:
  // The whole document; none when the value is nested too deeply. Ends the use of this object.
  std::optional<std::string> document(const Value& value) {
    out_.reserve(128 + estimatedLength(value));
    put("<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n"
        "<plist version=\"1.0\">\n");
    write(value, 0);
    begin(0);
    put("</plist>\n");
    flush();
    return tooDeep_ ? std::nullopt : std::optional(std::move(out_));
  }

 private:
  static constexpr std::size_t kBlock = 4096;
  static constexpr std::size_t kMaxTagLength = 16;
  // Of an element without its text or data: indentation, tags and a number.
  static constexpr std::size_t kMaxElementLength =
      kMaxDepth + 2 * kMaxTagLength + base::kMaxNumberLength;

  // `depth` is the number of containers around the value; it is the indentation too.
  void write(const Value& value, std::size_t depth) {
    std::visit([&](const auto& content) { write(content, depth); }, value.variant());
  }

  void write(const Number& number, std::size_t depth) {
    begin(depth);
    switch (number.type()) {
      case Number::Type::boolean:
        return number.boolValue() ? put("<true/>\n") : put("<false/>\n");
      case Number::Type::float32:
      case Number::Type::float64:
        put("<real>");
        end_ = base::writeReal(end_, number.doubleValue());
        return put("</real>\n");
      case Number::Type::uint64:
        put("<integer>");
        end_ = base::writeInteger(end_, number.uint64Value());
        return put("</integer>\n");
      case Number::Type::int32:
      case Number::Type::int64:
        put("<integer>");
        end_ = base::writeInteger(end_, number.int64Value());
        return put("</integer>\n");
    }
  }

  void write(const std::string& text, std::size_t depth) {
    begin(depth);
    put("<string>");
    putText(text);
    put("</string>\n");
  }

  void write(const Array& array, std::size_t depth) {
    if (!enters(depth)) return;
    begin(depth);
    if (array.empty()) return put("<array/>\n");
    put("<array>\n");
    for (const Value& element : array) write(element, depth + 1);
    begin(depth);
    put("</array>\n");
  }

  void write(const Dictionary& dictionary, std::size_t depth) {
    if (!enters(depth)) return;
    if (const auto written = withWritableKeys(dictionary)) return write(*written, depth);
    begin(depth);
    if (dictionary.empty()) return put("<dict/>\n");
    put("<dict>\n");
    for (const Dictionary::Entry& entry : dictionary) {
      begin(depth + 1);
      put("<key>");
      putText(entry.key);
      put("</key>\n");
      write(entry.value, depth + 1);
    }
    begin(depth);
    put("</dict>\n");
  }

  void write(const Date& date, std::size_t depth) {
    begin(depth);
    put("<date>");
    flush();
    base::appendTimestamp(out_, date.secondsSince1970);
    put("</date>\n");
  }

  void write(const Data& data, std::size_t depth) {
    begin(depth);
    put("<data>");
    flush();
    appendBase64(out_, data);
    put("</data>\n");
  }

  // Makes room for an element and indents it.
  void begin(std::size_t depth) {
    if (static_cast<std::size_t>(end_ - block_.data()) > kBlock - kMaxElementLength) flush();
    end_ = std::fill_n(end_, depth, '\t');
  }

  // Leaves room for an end tag.
  void putText(std::string_view text) {
    const auto used = static_cast<std::size_t>(end_ - block_.data());
    if (text.size() <= kBlock - kMaxTagLength - used && kEscaped.isPlain(text)) {
      end_ = std::copy(text.begin(), text.end(), end_);
    } else {
      flush();
      appendText(out_, text);
    }
  }

  template <std::size_t size>
  void put(const char (&text)[size]) {
    std::memcpy(end_, text, size - 1);
    end_ += size - 1;
  }

  void flush() {
    out_.append(block_.data(), end_);
    end_ = block_.data();
  }

  bool enters(std::size_t depth) {
    tooDeep_ |= depth >= static_cast<std::size_t>(kMaxDepth);
    return !tooDeep_;
  }

  std::string out_;  // what was composed before the block
  std::array<char, kBlock> block_;
  char* end_ = block_.data();  // of what stands in the block
  bool tooDeep_ = false;
};

}  // namespace

base::Result<std::string> writeXML(const Value& value) {
  if (auto document = Writer().document(value)) return std::move(*document);
  return base::Error{
      base::format("the value is nested deeper than %d arrays and dictionaries", kMaxDepth)};
}

}  // namespace plist
