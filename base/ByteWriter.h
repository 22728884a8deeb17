// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Numbers appended as little-endian bytes: what ByteReader reads.
#pragma once

#include <array>
#include <bit>
#include <cstddef>
#include <span>

namespace base {

// The bytes of an integer or a real number.
template <typename Number>
std::array<std::byte, sizeof(Number)> littleEndianBytes(Number value) {
  static_assert(std::endian::native == std::endian::little);
  return std::bit_cast<std::array<std::byte, sizeof(Number)>>(value);
}

// The low `width` bytes of a number, at most its own, to bytes of any type: std::byte, char,
// std::uint8_t.
template <typename Bytes, typename Number>
void appendLittleEndian(Bytes& bytes, Number value, std::size_t width = sizeof(Number)) {
  const auto whole = littleEndianBytes(value);
  for (const std::byte byte : std::span(whole).first(width)) {
    bytes.push_back(static_cast<typename Bytes::value_type>(byte));
  }
}

}  // namespace base
