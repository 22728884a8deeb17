// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "plist/XMLReader.h"

#include <expat.h>

#include <charconv>
#include <cstdint>
#include <memory>
#include <optional>
#include <system_error>
#include <utility>

#include "base/Text.h"
#include "base/Timestamp.h"
#include "plist/Allowance.h"
#include "plist/Base64.h"

namespace plist {

namespace {

// An element's name as a number, so that a switch can tell names apart; 0 for more than 7 letters.
constexpr std::uint64_t packed(const char* name) {
  std::uint64_t word = 0;
  for (int i = 0; i < 8; ++i) {
    if (name[i] == '\0') return word;
    word = word << 8 | static_cast<unsigned char>(name[i]);
  }
  return 0;
}

enum class Element { other, plist, dict, array, key, string, integer, real, date, data, yes, no };

Element elementOf(const char* name) {
  switch (packed(name)) {
    case packed("plist"):
      return Element::plist;
    case packed("dict"):
      return Element::dict;
    case packed("array"):
      return Element::array;
    case packed("key"):
      return Element::key;
    case packed("string"):
      return Element::string;
    case packed("integer"):
      return Element::integer;
    case packed("real"):
      return Element::real;
    case packed("date"):
      return Element::date;
    case packed("data"):
      return Element::data;
    case packed("true"):
      return Element::yes;
    case packed("false"):
      return Element::no;
    default:
      return Element::other;
  }
}

bool isSpace(char c) {
  constexpr std::uint64_t kSpaces = 1ull << ' ' | 1ull << '\t' | 1ull << '\n' | 1ull << '\r';
  return static_cast<unsigned char>(c) <= ' ' && (kSpaces >> c & 1) != 0;
}

bool isAllSpace(std::string_view text) {
  for (const char c : text) {
    if (!isSpace(c)) return false;
  }
  return true;
}

std::string_view trimmed(std::string_view text) {
  while (!text.empty() && isSpace(text.front())) text.remove_prefix(1);
  while (!text.empty() && isSpace(text.back())) text.remove_suffix(1);
  return text;
}

// Decimal or, after 0x, hexadecimal.
std::optional<Number> integerFrom(std::string_view text) {
  const bool negative = text.starts_with('-');
  if (negative || text.starts_with('+')) text.remove_prefix(1);
  int base = 10;
  if (text.starts_with("0x") || text.starts_with("0X")) {
    text.remove_prefix(2);
    base = 16;
  }
  std::uint64_t magnitude = 0;
  const char* end = text.data() + text.size();
  const auto parsed = std::from_chars(text.data(), end, magnitude, base);
  if (parsed.ec != std::errc{} || parsed.ptr != end) return std::nullopt;
  constexpr std::uint64_t kMax = INT64_MAX;
  if (!negative) {
    return magnitude <= kMax ? Number(static_cast<std::int64_t>(magnitude)) : Number(magnitude);
  }
  if (magnitude > kMax + 1) return std::nullopt;
  return Number(static_cast<std::int64_t>(0 - magnitude));
}

std::optional<double> realFrom(std::string_view text) {
  if (text.starts_with('+') && !text.starts_with("+-")) text.remove_prefix(1);
  double value = 0;
  const char* end = text.data() + text.size();
  const auto parsed = std::from_chars(text.data(), end, value);
  if (parsed.ec != std::errc{} || parsed.ptr != end) return std::nullopt;
  return value;
}

constexpr std::size_t kPiece = std::size_t{64} << 10;

// Builds the value while expat reads: containers grow in place, the scalar that is open gathers its
// text in a buffer that is used again and again.
class Reader {
 public:
  Reader() : parser_(XML_ParserCreate(nullptr)) {
    if (parser_ == nullptr) return;
    XML_SetUserData(parser_.get(), this);
    XML_SetElementHandler(
        parser_.get(),
        [](void* self, const char* name, const char**) {
          static_cast<Reader*>(self)->begin(elementOf(name));
        },
        [](void* self, const char*) { static_cast<Reader*>(self)->end(); });
    XML_SetCharacterDataHandler(parser_.get(), [](void* self, const char* text, int length) {
      static_cast<Reader*>(self)->characters({text, static_cast<std::size_t>(length)});
    });
    XML_SetStartDoctypeDeclHandler(
        parser_.get(), [](void* self, const char*, const char*, const char*, int internalSubset) {
          if (internalSubset != 0) static_cast<Reader*>(self)->fail("a DTD inside the document");
        });
    XML_SetSkippedEntityHandler(parser_.get(), [](void* self, const char*, int) {
      static_cast<Reader*>(self)->fail("an undefined entity");
    });
  }

  base::Result<Value> read(std::string_view bytes) {
    if (parser_ == nullptr) return base::Error{"XML property list: out of memory"};
    // In pieces: expat copies what it is given.
    XML_Status status = XML_STATUS_OK;
    do {
      const std::string_view piece = bytes.substr(0, kPiece);
      bytes.remove_prefix(piece.size());
      status = XML_Parse(parser_.get(), piece.data(), static_cast<int>(piece.size()),
                         bytes.empty() ? XML_TRUE : XML_FALSE);
    } while (status == XML_STATUS_OK && !bytes.empty());
    if (status != XML_STATUS_OK && error_.empty()) {
      fail(XML_ErrorString(XML_GetErrorCode(parser_.get())));
    }
    if (!error_.empty()) return base::Error{std::move(error_)};
    return std::move(*root_);
  }

 private:
  struct ParserDeleter {
    void operator()(XML_Parser parser) const { XML_ParserFree(parser); }
  };

  // An open container; one of the two is null. Borrowed from the value that is being built.
  struct Container {
    Array* array;
    Dictionary* dictionary;
  };

  // The first failure counts: expat may call a few more handlers after it.
  void fail(std::string_view text) {
    if (!error_.empty()) return;
    error_ =
        base::format("XML property list, line %llu, column %llu: %.*s",
                     static_cast<unsigned long long>(XML_GetCurrentLineNumber(parser_.get())),
                     static_cast<unsigned long long>(XML_GetCurrentColumnNumber(parser_.get())) + 1,
                     static_cast<int>(text.size()), text.data());
    XML_StopParser(parser_.get(), XML_FALSE);
  }

  bool failed() const { return !error_.empty(); }

  void begin(Element element) {
    if (failed()) return;
    if (!inPlist_) {
      if (element != Element::plist) return fail("the root element is not plist");
      inPlist_ = true;
      return;
    }
    if (element == Element::other || element == Element::plist) {
      return fail("the element is no property-list value");
    }
    if (scalar_ != Element::other) return fail("an element inside a scalar");
    const bool isKey = element == Element::key;
    if (containers_.empty() || containers_.back().dictionary == nullptr) {
      if (isKey) return fail("a key outside of a dictionary");
      if (containers_.empty() && root_) return fail("a second top-level value");
    } else if (isKey == hasKey_) {
      return fail(isKey ? "a key without a value" : "a value without a key");
    }
    if (!isKey && !takeValue()) return fail("too many values");
    if (element == Element::array) {
      open(Array());
    } else if (element == Element::dict) {
      open(Dictionary());
    } else {
      scalar_ = element;
      text_.clear();
    }
  }

  // The room for a value, and for the key before it. Containers begin with room for a few.
  bool takeValue() {
    if (containers_.empty()) return true;
    if (const Dictionary* dictionary = containers_.back().dictionary) {
      return allowance_.takeEntries(1) && allowance_.takeContent(key_.size()) &&
             (!dictionary->empty() || allowance_.takeUnusedEntries(kUsualDictionarySize - 1));
    }
    return allowance_.takeElements(1) && (!containers_.back().array->empty() ||
                                          allowance_.takeUnusedElements(kUsualArraySize - 1));
  }

  template <typename Empty>
  void open(Empty empty) {
    if (containers_.size() >= static_cast<std::size_t>(kMaxDepth)) {
      return fail(base::format("nested deeper than %d", kMaxDepth));
    }
    Value& value = place(std::move(empty));
    containers_.push_back({value.as<Array>(), value.as<Dictionary>()});
  }

  void end() {
    if (failed()) return;
    if (scalar_ != Element::other) {
      endScalar();
      scalar_ = Element::other;
    } else if (!containers_.empty()) {
      if (hasKey_) return fail("a key without a value");
      containers_.pop_back();
    } else if (!root_) {
      fail("no value");
    }
  }

  void endScalar() {
    if (!allowance_.takeContent(text_.size())) return fail("too much text and data");
    switch (scalar_) {
      case Element::key:
        key_.swap(text_);
        hasKey_ = true;
        break;
      case Element::string:
        place(text_);
        break;
      case Element::integer:
        placeIf(integerFrom(trimmed(text_)), "no integer, or out of range");
        break;
      case Element::real:
        placeIf(realFrom(trimmed(text_)), "no real number, or out of range");
        break;
      case Element::date:
        if (const auto seconds = base::secondsFromTimestamp(trimmed(text_))) {
          place(Date{*seconds});
        } else {
          fail("no date");
        }
        break;
      case Element::data:
        placeIf(bytesFromBase64(text_), "no base64 data");
        break;
      default:
        place(scalar_ == Element::yes);
        break;
    }
  }

  template <typename Content>
  void placeIf(std::optional<Content> content, const char* otherwise) {
    if (content) {
      place(std::move(*content));
    } else {
      fail(otherwise);
    }
  }

  // Puts a value where it belongs.
  template <typename Content>
  Value& place(Content&& content) {
    if (containers_.empty()) return root_.emplace(std::forward<Content>(content));
    const Container& container = containers_.back();
    if (container.array != nullptr) {
      if (container.array->empty()) container.array->reserve(kUsualArraySize);
      return container.array->emplace_back(std::forward<Content>(content));
    }
    hasKey_ = false;
    return container.dictionary->set(std::string_view(key_), std::forward<Content>(content));
  }

  void characters(std::string_view text) {
    if (scalar_ == Element::other && text == "\n") return;  // expat hands each over by itself
    if (failed()) return;
    const bool takesText =
        scalar_ != Element::other && scalar_ != Element::yes && scalar_ != Element::no;
    if (takesText) {
      text_ += text;
    } else if (!isAllSpace(text)) {
      fail("text outside of a scalar");
    }
  }

  std::unique_ptr<XML_ParserStruct, ParserDeleter> parser_;
  std::optional<Value> root_;
  bool inPlist_ = false;
  std::vector<Container> containers_;
  Element scalar_ = Element::other;  // the scalar that is open; other: none
  std::string text_;                 // its text
  std::string key_;                  // the key that waits for its value
  bool hasKey_ = false;
  Allowance allowance_;
  std::string error_;
};

}  // namespace

base::Result<Value> readXML(std::string_view bytes) { return Reader().read(bytes); }

}  // namespace plist
