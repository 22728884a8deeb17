// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Little-endian numbers and runs of bytes out of foreign bytes, one after the other.
#pragma once

#include <algorithm>
#include <array>
#include <bit>
#include <concepts>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <optional>
#include <span>

namespace base {

// The number that the bytes hold.
template <std::unsigned_integral T>
T littleEndian(std::span<const std::byte, sizeof(T)> bytes) {
  static_assert(std::endian::native == std::endian::little);
  T value;
  std::memcpy(&value, bytes.data(), sizeof value);
  return value;
}

// The number that one to eight bytes hold.
inline std::uint64_t littleEndianOfAnyWidth(std::span<const std::byte> bytes) {
  std::array<std::byte, sizeof(std::uint64_t)> extended = {};
  std::memcpy(extended.data(), bytes.data(), std::min(bytes.size(), extended.size()));
  return littleEndian<std::uint64_t>(extended);
}

// A place in bytes that somebody else keeps. Nothing beyond their end is read: what doesn't fit in
// the rest is none, and leaves the place as it is.
class ByteReader {
 public:
  explicit ByteReader(std::span<const std::byte> bytes) : rest_(bytes) {}

  // What has not been read yet.
  std::span<const std::byte> rest() const { return rest_; }

  // The next number, with the place moved behind it.
  template <std::unsigned_integral T>
  std::optional<T> read() {
    if (rest_.size() < sizeof(T)) return std::nullopt;
    const T value = littleEndian<T>(rest_.template first<sizeof(T)>());
    rest_ = rest_.subspan(sizeof(T));
    return value;
  }

  // The next `size` bytes, with the place moved behind them.
  std::optional<std::span<const std::byte>> take(std::uint64_t size) {
    if (size > rest_.size()) return std::nullopt;
    const auto bytes = rest_.first(static_cast<std::size_t>(size));
    rest_ = rest_.subspan(bytes.size());
    return bytes;
  }

 private:
  std::span<const std::byte> rest_;
};

}  // namespace base
