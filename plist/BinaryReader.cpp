// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "plist/BinaryReader.h"

#include <algorithm>
#include <array>
#include <bit>
#include <cmath>
#include <cstdint>
#include <optional>

#include "base/Text.h"
#include "base/UTF8.h"
#include "plist/Allowance.h"

namespace plist {

namespace {

constexpr std::string_view kHeader = "bplist00";
constexpr std::uint64_t kTrailerSize = 32;
constexpr double kSecondsFrom1970To2001 = 978307200;

// What a file may expand to: shared objects are read once for each reference.
constexpr std::uint64_t kFreeObjects = 4096;  // plus one for each byte of the file
constexpr std::uint64_t kMaxContent = std::uint64_t{64} << 20;  // bytes of text and data

class Reader {
 public:
  explicit Reader(std::string_view bytes)
      : bytes_(bytes), objectsLeft_(kFreeObjects + bytes.size()) {}

  base::Result<Value> read() {
    std::optional<Value> value;
    if (readTrailer()) value = object(top_, 0);
    if (!value) {
      return base::Error{base::format("binary property list, offset %llu: %s",
                                      static_cast<unsigned long long>(errorOffset_),
                                      error_.c_str())};
    }
    return std::move(*value);
  }

 private:
  enum Marker : unsigned {
    kSimple = 0x0,
    kInteger = 0x1,
    kReal = 0x2,
    kDate = 0x3,
    kData = 0x4,
    kASCII = 0x5,
    kUTF16 = 0x6,
    kUTF8 = 0x7,
    kArray = 0xA,
    kDictionary = 0xD
  };

  // An object's marker byte, and where what follows it begins.
  struct Object {
    std::uint64_t offset;
    unsigned marker, low;  // the halves of the byte
    std::uint64_t content() const { return offset + 1; }
  };

  // A range of bytes that lies within the objects.
  struct Range {
    std::uint64_t begin, size;
  };

  std::nullopt_t fail(std::uint64_t offset, std::string error) {
    errorOffset_ = offset;
    error_ = std::move(error);
    return std::nullopt;
  }

  // The number of `size` bytes, 8 at most, at an offset that has been checked.
  std::uint64_t number(std::uint64_t offset, std::uint64_t size) const {
    std::uint64_t value = 0;
    for (const char byte : bytes_.substr(offset, size)) {
      value = value << 8 | static_cast<unsigned char>(byte);
    }
    return value;
  }

  bool readTrailer() {
    const std::uint64_t size = bytes_.size();
    if (size < kHeader.size() + kTrailerSize) {
      fail(size, "the file is too short");
      return false;
    }
    if (!bytes_.starts_with(kHeader)) {
      fail(0, "not version 00 of the encoding");
      return false;
    }
    const std::uint64_t trailer = size - kTrailerSize;
    offsetSize_ = number(trailer + 6, 1);
    referenceSize_ = number(trailer + 7, 1);
    count_ = number(trailer + 8, 8);
    top_ = number(trailer + 16, 8);
    table_ = number(trailer + 24, 8);
    const bool widths =
        offsetSize_ >= 1 && offsetSize_ <= 8 && referenceSize_ >= 1 && referenceSize_ <= 8;
    const bool table = table_ >= kHeader.size() && table_ <= trailer;
    if (!widths || !table || count_ > (trailer - table_) / offsetSize_) {
      fail(trailer, "the trailer contradicts the file");
      return false;
    }
    return true;
  }

  // Whether `count` things of `width` bytes fit between an offset and the end of the objects.
  bool fits(std::uint64_t offset, std::uint64_t count, std::uint64_t width) const {
    return offset <= table_ && count <= (table_ - offset) / width;
  }

  std::optional<Object> locate(std::uint64_t reference) {
    if (reference >= count_) return fail(bytes_.size() - kTrailerSize, "no such object");
    const std::uint64_t entry = table_ + reference * offsetSize_;
    const std::uint64_t offset = number(entry, offsetSize_);
    if (offset < kHeader.size() || !fits(offset, 1, 1)) {
      return fail(entry, "the object's offset lies outside of the objects");
    }
    const std::uint64_t marker = number(offset, 1);
    return Object{offset, static_cast<unsigned>(marker >> 4), static_cast<unsigned>(marker & 15)};
  }

  // The elements of a counted object, each of `width` bytes. The count is in the marker, or is an
  // integer object behind it.
  std::optional<Range> elements(const Object& object, std::uint64_t width) {
    std::uint64_t begin = object.content(), count = object.low;
    if (object.low == 15) {
      if (!fits(begin, 1, 1)) return fail(object.offset, "the count is cut off");
      const std::uint64_t marker = number(begin, 1);
      const std::uint64_t size = std::uint64_t{1} << (marker & 15);
      if (marker >> 4 != kInteger || size > 8 || !fits(begin + 1, size, 1)) {
        return fail(object.offset, "the count is not an integer");
      }
      count = number(begin + 1, size);
      begin += 1 + size;
    }
    if (!fits(begin, count, width)) return fail(object.offset, "the count is beyond the objects");
    return Range{begin, count};
  }

  std::optional<Value> object(std::uint64_t reference, int depth) {
    const std::optional<Object> object = locate(reference);
    if (!object) return std::nullopt;
    switch (object->marker) {
      case kSimple:
        if (object->low == 8 || object->low == 9) return Value(object->low == 9);
        break;
      case kInteger:
        return integer(*object);
      case kReal:
        return real(*object);
      case kDate:
        return date(*object);
      case kData:
        return data(*object);
      case kASCII:
      case kUTF16:
      case kUTF8:
        return text(*object);
      case kArray:
      case kDictionary:
        return container(*object, depth);
      default:
        break;
    }
    return fail(object->offset, base::format("no property-list value (marker 0x%X%X)",
                                             object->marker, object->low));
  }

  std::optional<Value> integer(const Object& object) {
    const std::uint64_t size = std::uint64_t{1} << object.low;
    if (size > 16) return fail(object.offset, "an integer of more than 16 bytes");
    if (!fits(object.content(), size, 1)) return fail(object.offset, "the integer is cut off");
    const std::uint64_t low = number(object.content() + size - std::min<std::uint64_t>(size, 8),
                                     std::min<std::uint64_t>(size, 8));
    const auto asSigned = static_cast<std::int64_t>(low);
    if (size <= 8) return Value(asSigned);
    const std::uint64_t high = number(object.content(), 8);
    if (high == 0) return asSigned >= 0 ? Value(asSigned) : Value(low);
    if (high == UINT64_MAX && asSigned < 0) return Value(asSigned);
    return fail(object.offset, "the integer is out of range");
  }

  std::optional<Value> real(const Object& object) {
    const std::uint64_t size = std::uint64_t{1} << object.low;
    if (size != 4 && size != 8) return fail(object.offset, "a real of neither 4 nor 8 bytes");
    if (!fits(object.content(), size, 1)) return fail(object.offset, "the real is cut off");
    const std::uint64_t bits = number(object.content(), size);
    return size == 4 ? Value(std::bit_cast<float>(static_cast<std::uint32_t>(bits)))
                     : Value(std::bit_cast<double>(bits));
  }

  std::optional<Value> date(const Object& object) {
    if (object.low != 3) return fail(object.offset, "a date not of 8 bytes");
    if (!fits(object.content(), 8, 1)) return fail(object.offset, "the date is cut off");
    const double seconds = std::bit_cast<double>(number(object.content(), 8));
    if (!std::isfinite(seconds)) return fail(object.offset, "the date is no instant");
    return Value(Date{seconds + kSecondsFrom1970To2001});
  }

  std::optional<Value> data(const Object& object) {
    const std::optional<Range> range = elements(object, 1);
    if (!range || !takeContent(object, range->size)) return std::nullopt;
    const auto bytes = bytes_.substr(range->begin, range->size);
    return Value(Data(bytes.begin(), bytes.end()));
  }

  std::optional<std::string> text(const Object& object) {
    const std::uint64_t width = object.marker == kUTF16 ? 2 : 1;
    const std::optional<Range> range = elements(object, width);
    if (!range) return std::nullopt;
    std::string text;
    if (object.marker == kUTF16) {
      text.reserve(range->size);
      appendUTF16(text, *range);
    } else {
      std::string room;
      text = base::writable(bytes_.substr(range->begin, range->size), room);
    }
    if (!takeContent(object, text.size())) return std::nullopt;
    return text;
  }

  void appendUTF16(std::string& text, const Range& units) const {
    const auto unit = [&](std::uint64_t i) {
      return static_cast<char32_t>(number(units.begin + 2 * i, 2));
    };
    for (std::uint64_t i = 0; i < units.size; ++i) {
      char32_t character = unit(i);
      if (character >> 10 == 0xD800 >> 10 && i + 1 < units.size &&
          unit(i + 1) >> 10 == 0xDC00 >> 10) {
        character = 0x10000 + ((character & 0x3FF) << 10) + (unit(++i) & 0x3FF);
      }
      base::appendCharacter(text, character);
    }
  }

  std::optional<Value> container(const Object& object, int depth) {
    if (depth >= kMaxDepth) {
      return fail(object.offset, base::format("nested deeper than %d", kMaxDepth));
    }
    const auto end = path_.begin() + depth;
    if (std::find(path_.begin(), end, object.offset) != end) {
      return fail(object.offset, "the container holds itself");
    }
    path_[static_cast<std::size_t>(depth)] = object.offset;
    const bool isArray = object.marker == kArray;
    const std::optional<Range> range =
        elements(object, isArray ? referenceSize_ : 2 * referenceSize_);
    if (!range) return std::nullopt;
    const bool room = range->size <= objectsLeft_ &&
                      (isArray ? allowance_.takeElements(range->size) : takeEntries(range->size));
    if (!room) return fail(object.offset, "too many objects");
    objectsLeft_ -= range->size;
    return isArray ? array(*range, depth) : dictionary(*range, depth);
  }

  std::optional<Value> array(const Range& references, int depth) {
    Array array;
    array.reserve(references.size);
    for (std::uint64_t i = 0; i < references.size; ++i) {
      std::optional<Value> element = object(reference(references, i), depth + 1);
      if (!element) return std::nullopt;
      array.push_back(std::move(*element));
    }
    return Value(std::move(array));
  }

  // All references to keys, then all references to values.
  std::optional<Value> dictionary(const Range& references, int depth) {
    Dictionary dictionary;
    for (std::uint64_t i = 0; i < references.size; ++i) {
      const std::optional<Object> keyObject = locate(reference(references, i));
      if (!keyObject) return std::nullopt;
      if (keyObject->marker < kASCII || keyObject->marker > kUTF8) {
        return fail(keyObject->offset, "a key that is no text");
      }
      std::optional<std::string> key = text(*keyObject);
      if (!key) return std::nullopt;
      std::optional<Value> value = object(reference(references, references.size + i), depth + 1);
      if (!value) return std::nullopt;
      dictionary.set(std::move(*key), std::move(*value));
    }
    return Value(std::move(dictionary));
  }

  std::uint64_t reference(const Range& references, std::uint64_t i) const {
    return number(references.begin + i * referenceSize_, referenceSize_);
  }

  bool takeEntries(std::uint64_t size) {
    constexpr std::uint64_t kUsual = kUsualDictionarySize;
    const std::uint64_t unused = size == 0 || size >= kUsual ? 0 : kUsual - size;
    return allowance_.takeEntries(size) && allowance_.takeUnusedEntries(unused);
  }

  bool takeContent(const Object& object, std::uint64_t size) {
    if (size > contentLeft_ || !allowance_.takeContent(size)) {
      fail(object.offset, "too much text and data");
      return false;
    }
    contentLeft_ -= size;
    return true;
  }

  std::string_view bytes_;
  std::uint64_t offsetSize_ = 0, referenceSize_ = 0, count_ = 0, top_ = 0, table_ = 0;
  std::uint64_t objectsLeft_;
  Allowance allowance_;
  std::uint64_t contentLeft_ = kMaxContent;
  std::array<std::uint64_t, kMaxDepth> path_{};  // offsets of the open containers
  std::uint64_t errorOffset_ = 0;
  std::string error_;
};

}  // namespace

base::Result<Value> readBinary(std::string_view bytes) { return Reader(bytes).read(); }

}  // namespace plist
