// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Writes binary property lists for tests: values (a truth value as a number), or objects given byte
// by byte, which makes lists that no honest writer would.
#pragma once

#include <bit>
#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "plist/Value.h"

namespace support {

class BinaryPropertyList {
 public:
  explicit BinaryPropertyList(std::size_t referenceSize = 2) : referenceSize_(referenceSize) {}

  static std::string of(const plist::Value& value) {
    BinaryPropertyList list(3);
    const std::size_t top = list.add(value);
    return list.finish(top);
  }

  // Each of these adds an object and returns its number, which references name.
  std::size_t object(std::string_view bytes) {
    offsets_.push_back(bytes_.size());
    bytes_ += bytes;
    return offsets_.size() - 1;
  }

  // A marker, a count, and what is counted.
  std::size_t counted(unsigned marker, std::size_t count, std::string_view content) {
    std::string bytes;
    if (count < 15) {
      bytes = bigEndian(marker << 4 | count, 1);
    } else {
      bytes = bigEndian(marker << 4 | 15, 1) + "\x12" + bigEndian(count, 4);
    }
    return object(bytes.append(content));
  }

  // An array (marker 0xA), or a dictionary (0xD) with all keys before all values.
  std::size_t container(unsigned marker, const std::vector<std::size_t>& references) {
    std::string content;
    for (const std::size_t reference : references) content += bigEndian(reference, referenceSize_);
    return counted(marker, references.size() / (marker == 0xD ? 2 : 1), content);
  }

  std::size_t add(const plist::Value& value) {
    if (const auto* number = value.as<plist::Number>()) {
      return number->isReal()
                 ? object("\x23" +
                          bigEndian(std::bit_cast<std::uint64_t>(number->doubleValue()), 8))
                 : object("\x13" + bigEndian(number->uint64Value(), 8));
    }
    if (const auto* text = value.as<std::string>()) return counted(0x7, text->size(), *text);
    if (const auto* data = value.as<plist::Data>()) {
      return counted(0x4, data->size(), std::string(data->begin(), data->end()));
    }
    if (const auto* date = value.as<plist::Date>()) {
      const double since2001 = date->secondsSince1970 - 978307200;
      return object("\x33" + bigEndian(std::bit_cast<std::uint64_t>(since2001), 8));
    }
    std::vector<std::size_t> references, values;
    if (const auto* array = value.as<plist::Array>()) {
      for (const plist::Value& element : *array) references.push_back(add(element));
      return container(0xA, references);
    }
    for (const auto& [key, content] : *value.as<plist::Dictionary>()) {
      references.push_back(counted(0x7, key.size(), key));
      values.push_back(add(content));
    }
    references.insert(references.end(), values.begin(), values.end());
    return container(0xD, references);
  }

  // The offset of the next object.
  std::size_t offset() const { return bytes_.size(); }

  // The file, with offsets of 4 bytes and the top level given.
  std::string finish(std::size_t top) const {
    std::string file = bytes_;
    for (const std::size_t offset : offsets_) file += bigEndian(offset, 4);
    return file + bigEndian(0, 6) + bigEndian(4, 1) + bigEndian(referenceSize_, 1) +
           bigEndian(offsets_.size(), 8) + bigEndian(top, 8) + bigEndian(bytes_.size(), 8);
  }

  static std::string bigEndian(std::uint64_t value, std::size_t size) {
    std::string bytes(size, '\0');
    for (; size > 0; value >>= 8) bytes[--size] = static_cast<char>(value & 0xFF);
    return bytes;
  }

 private:
  std::size_t referenceSize_;
  std::string bytes_ = "bplist00";
  std::vector<std::size_t> offsets_;
};

}  // namespace support
