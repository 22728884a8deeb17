// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/bus/BusMessage.h"

#include <cstring>
#include <string>
#include <string_view>
#include <type_traits>
#include <utility>

#include "base/UTF8.h"

namespace host {

namespace {

class Reader {
 public:
  explicit Reader(sd_bus_message* message) : message_(message) {}

  // Each read goes past what it reads. It fails only when the body contradicts its signature; a
  // value that has no counterpart, or is beyond a limit, is none.
  bool readEntries(plist::Dictionary& dictionary, int depth);
  std::size_t dropped() const { return dropped_; }

 private:
  bool readValue(std::optional<plist::Value>& value, int depth);
  bool readArray(plist::Array& array, int depth);
  bool readContent(char type, const char* contents, std::optional<plist::Value>& value, int depth);
  bool readText(char type, std::optional<plist::Value>& value);
  bool readData(std::optional<plist::Value>& value);
  template <typename Wire, typename Kept = std::int64_t>
  bool readNumber(char type, std::optional<plist::Value>& value);

  bool enter(char type, const char* contents) {
    return sd_bus_message_enter_container(message_, type, contents) > 0;
  }
  bool leave() { return sd_bus_message_exit_container(message_) >= 0; }
  bool skip() { return sd_bus_message_skip(message_, nullptr) > 0; }
  // Whether the container that was entered has no more elements; false on a failure, too, which the
  // next read then meets.
  bool atEnd() { return sd_bus_message_at_end(message_, 0) > 0; }

  // Takes bytes or a value from what the message may still cost.
  bool affordBytes(std::size_t length) { return take(bytes_, length); }
  bool affordValue() { return take(values_, 1); }
  bool take(std::size_t& left, std::size_t amount) {
    const bool enough = amount <= left;
    if (enough) {
      left -= amount;
    } else {
      ++dropped_;
    }
    return enough;
  }

  sd_bus_message* message_;
  std::size_t bytes_ = kMaxBytes;
  std::size_t values_ = kMaxValues;
  std::size_t dropped_ = 0;
};

bool Reader::readEntries(plist::Dictionary& dictionary, int depth) {
  std::string room;
  for (std::size_t count = 0; !atEnd(); ++count) {
    if (count >= kMaxElements) {
      ++dropped_;
      if (!skip()) return false;
      continue;
    }
    const char* key = nullptr;
    if (!enter('e', nullptr) || sd_bus_message_read_basic(message_, 's', &key) <= 0) return false;
    const std::string_view name = key;
    if (affordBytes(name.size())) {
      std::optional<plist::Value> value;
      if (!readValue(value, depth)) return false;
      if (value) dictionary.set(base::writable(name, room), std::move(*value));
    } else if (!skip()) {
      return false;
    }
    if (!leave()) return false;
  }
  return true;
}

bool Reader::readArray(plist::Array& array, int depth) {
  for (std::size_t count = 0; !atEnd(); ++count) {
    if (count >= kMaxElements) {
      ++dropped_;
      if (!skip()) return false;
      continue;
    }
    std::optional<plist::Value> value;
    if (!readValue(value, depth)) return false;
    if (value) array.push_back(std::move(*value));
  }
  return true;
}

bool Reader::readValue(std::optional<plist::Value>& value, int depth) {
  char type = 0;
  const char* contents = nullptr;
  if (sd_bus_message_peek_type(message_, &type, &contents) <= 0) return false;
  if (depth >= kMaxNesting) {
    ++dropped_;
    return skip();
  }
  // A variant costs what it holds.
  if (type != 'v' && !affordValue()) return skip();
  return readContent(type, contents, value, depth);
}

bool Reader::readContent(char type, const char* contents, std::optional<plist::Value>& value,
                         int depth) {
  switch (type) {
    case 'y':
      return readNumber<std::uint8_t>(type, value);
    case 'n':
      return readNumber<std::int16_t>(type, value);
    case 'q':
      return readNumber<std::uint16_t>(type, value);
    case 'i':
      return readNumber<std::int32_t>(type, value);
    case 'u':
      return readNumber<std::uint32_t>(type, value);
    case 'x':
      return readNumber<std::int64_t>(type, value);
    case 't':
      return readNumber<std::uint64_t>(type, value);
    case 'd':
      return readNumber<double, double>(type, value);
    case 'b':
      return readNumber<int, bool>(type, value);
    case 's':
    case 'o':
    case 'g':
      return readText(type, value);
    case 'v':
      return enter(type, contents) && readValue(value, depth + 1) && leave();
    case 'a':
      if (std::strcmp(contents, "y") == 0) return readData(value);
      if (contents[0] == '{' && contents[1] != 's') return skip();
      if (!enter(type, contents)) return false;
      if (contents[0] == '{') {
        plist::Dictionary dictionary;
        if (!readEntries(dictionary, depth + 1)) return false;
        value.emplace(std::move(dictionary));
      } else {
        plist::Array array;
        if (!readArray(array, depth + 1)) return false;
        value.emplace(std::move(array));
      }
      return leave();
    default:
      return skip();
  }
}

template <typename Wire, typename Kept>
bool Reader::readNumber(char type, std::optional<plist::Value>& value) {
  Wire number{};
  if (sd_bus_message_read_basic(message_, type, &number) <= 0) return false;
  if constexpr (std::is_same_v<Wire, std::uint64_t>) {
    if (number > INT64_MAX) {
      value.emplace(number);
      return true;
    }
  }
  value.emplace(static_cast<Kept>(number));
  return true;
}

bool Reader::readText(char type, std::optional<plist::Value>& value) {
  const char* text = nullptr;
  if (sd_bus_message_read_basic(message_, type, &text) <= 0) return false;
  const std::string_view view = text;
  std::string room;
  if (affordBytes(view.size())) value.emplace(base::writable(view, room));
  return true;
}

bool Reader::readData(std::optional<plist::Value>& value) {
  const void* bytes = nullptr;
  std::size_t length = 0;
  if (sd_bus_message_read_array(message_, 'y', &bytes, &length) < 0) return false;
  const auto* first = static_cast<const std::uint8_t*>(bytes);
  if (affordBytes(length)) value.emplace(plist::Data(first, first + length));
  return true;
}

}  // namespace

std::optional<BusDictionary> readDictionary(sd_bus_message* message) {
  if (sd_bus_message_rewind(message, 1) < 0) return std::nullopt;
  if (sd_bus_message_enter_container(message, 'a', "{sv}") <= 0) return std::nullopt;
  Reader reader(message);
  BusDictionary read;
  if (!reader.readEntries(read.dictionary, 1)) return std::nullopt;
  read.dropped = reader.dropped();
  return read;
}

}  // namespace host
