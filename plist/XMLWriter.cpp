#include "plist/PropertyList.h"

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

class Writer {
 public:
  // `depth` is the number of containers around the value; it is the indentation too.
  void write(const Value& value, std::size_t depth) {
    std::visit([&](const auto& content) { write(content, depth); }, value.variant());
  }

  std::string out;
  bool tooDeep = false;

 private:
  void write(const Number& number, std::size_t depth) {
    indent(depth);
    switch (number.type()) {
      case Number::Type::boolean:
        out += number.boolValue() ? "<true/>\n" : "<false/>\n";
        break;
      case Number::Type::float32:
      case Number::Type::float64:
        out += "<real>";
        base::appendReal(out, number.doubleValue());
        out += "</real>\n";
        break;
      case Number::Type::uint64:
        out += "<integer>";
        base::appendInteger(out, number.uint64Value());
        out += "</integer>\n";
        break;
      case Number::Type::int32:
      case Number::Type::int64:
        out += "<integer>";
        base::appendInteger(out, number.int64Value());
        out += "</integer>\n";
        break;
    }
  }

  void write(const std::string& text, std::size_t depth) {
    indent(depth);
    out += "<string>";
    appendText(out, text);
    out += "</string>\n";
  }

  void write(const Array& array, std::size_t depth) {
    if (!enters(depth)) return;
    indent(depth);
    if (array.empty()) {
      out += "<array/>\n";
    } else {
      out += "<array>\n";
      for (const Value& element : array) write(element, depth + 1);
      indent(depth);
      out += "</array>\n";
    }
  }

  void write(const Dictionary& dictionary, std::size_t depth) {
    if (!enters(depth)) return;
    if (const auto written = withWritableKeys(dictionary)) return write(*written, depth);
    indent(depth);
    if (dictionary.empty()) {
      out += "<dict/>\n";
    } else {
      out += "<dict>\n";
      for (const Dictionary::Entry& entry : dictionary) {
        indent(depth + 1);
        out += "<key>";
        appendText(out, entry.key);
        out += "</key>\n";
        write(entry.value, depth + 1);
      }
      indent(depth);
      out += "</dict>\n";
    }
  }

  void write(const Date& date, std::size_t depth) {
    indent(depth);
    out += "<date>";
    base::appendTimestamp(out, date.secondsSince1970);
    out += "</date>\n";
  }

  void write(const Data& data, std::size_t depth) {
    indent(depth);
    out += "<data>";
    appendBase64(out, data);
    out += "</data>\n";
  }

  void indent(std::size_t depth) { out.append(depth, '\t'); }

  bool enters(std::size_t depth) {
    tooDeep |= depth >= static_cast<std::size_t>(kMaxDepth);
    return !tooDeep;
  }
};

}  // namespace

base::Result<std::string> writeXML(const Value& value) {
  Writer writer;
  writer.out.reserve(128 + estimatedLength(value));
  writer.out =
      "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n"
      "<plist version=\"1.0\">\n";
  writer.write(value, 0);
  if (writer.tooDeep) {
    return base::Error{
        base::format("the value is nested deeper than %d arrays and dictionaries", kMaxDepth)};
  }
  writer.out += "</plist>\n";
  return std::move(writer.out);
}

}  // namespace plist
