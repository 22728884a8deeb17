// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What targets have in common: how they say what must hold, and how an input is taken apart.
#pragma once

#include <algorithm>
#include <concepts>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <span>
#include <string>
#include <string_view>

#include "base/ByteReader.h"
#include "plist/Value.h"

namespace fuzz {

inline void require(bool holds, const char* what) {
  if (holds) return;
  std::fprintf(stderr, "it doesn't hold that %s\n", what);
  std::abort();
}

inline std::string_view textOf(std::span<const std::byte> bytes) {
  return {reinterpret_cast<const char*>(bytes.data()), bytes.size()};
}

// Every input is one: where it ends, numbers are 0 and texts empty.
class Input {
 public:
  Input(const std::uint8_t* bytes, std::size_t size)
      : reader_(std::as_bytes(std::span(bytes, size))) {}

  template <std::unsigned_integral T>
  T number() {
    return reader_.read<T>().value_or(0);
  }
  std::span<const std::byte> bytes(std::size_t size) {
    return *reader_.take(std::min(size, reader_.rest().size()));
  }
  std::span<const std::byte> rest() { return bytes(reader_.rest().size()); }
  bool empty() const { return reader_.rest().empty(); }

 private:
  base::ByteReader reader_;
};

// A property-list value out of an input: a byte says the kind in its low three bits, and how many
// or how large in the others. Texts and keys are words of the vocabulary (by their place) or,
// beyond it, as many bytes of the input as are left over.
class Values {
 public:
  Values(Input& input, std::span<const std::string_view> vocabulary)
      : input_(input), vocabulary_(vocabulary) {}

  std::string text() {
    const std::size_t place = input_.number<std::uint8_t>();
    if (place < vocabulary_.size()) return std::string(vocabulary_[place]);
    return std::string(fuzz::textOf(input_.bytes(place - vocabulary_.size())));
  }

  plist::Value value(int depth = 0) {
    const unsigned head = input_.number<std::uint8_t>();
    const unsigned size = depth < kMaxDepth ? head >> 3 : 0;
    switch (head & 7) {
      case 0:
        return std::int64_t{head >> 3};
      case 1:
        return text();
      case 2:
        return array(size, depth);
      case 3:
        return dictionary(size, depth);
      case 4:
        return plist::Date{input_.number<std::uint16_t>() * 43200.0 + size};
      case 5: {
        const auto data = textOf(input_.bytes(size));
        return plist::Data(data.begin(), data.end());
      }
      case 6:
        return number(head >> 3);
      default:
        return static_cast<std::int64_t>(input_.number<std::uint64_t>());
    }
  }

  plist::Array array(unsigned size, int depth = 0) {
    plist::Array values;
    for (; values.size() < size && !input_.empty();) values.push_back(value(depth + 1));
    return values;
  }

  plist::Dictionary dictionary(unsigned size, int depth = 0) {
    plist::Dictionary entries;
    for (unsigned i = 0; i < size && !input_.empty(); ++i) {
      const std::string key = text();
      entries.set(key, value(depth + 1));
    }
    return entries;
  }

 private:
  static constexpr int kMaxDepth = 6;

  // The types that are rare.
  plist::Value number(unsigned type) {
    const auto bits = input_.number<std::uint64_t>();
    if (type == 0) return bits % 2 == 1;
    if (type == 1) return bits;
    if (type == 2) return static_cast<std::int32_t>(bits & 0x7FFFFFFF);
    const auto whole = static_cast<std::int64_t>(bits);
    return type % 2 == 0 ? static_cast<double>(whole) / 1024
                         : static_cast<double>(whole & 0xFFFFF) * 1e295;
  }

  Input& input_;
  std::span<const std::string_view> vocabulary_;
};

}  // namespace fuzz
