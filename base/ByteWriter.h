// Numbers as little-endian bytes: what ByteReader reads.
#pragma once

#include <array>
#include <bit>
#include <cstddef>
#include <type_traits>

namespace base {

template <typename Number>
requires std::is_arithmetic_v<Number> std::array<std::byte, sizeof(Number)> littleEndianBytes(
    Number value) {
  static_assert(std::endian::native == std::endian::little);
  return std::bit_cast<std::array<std::byte, sizeof(Number)>>(value);
}

// To bytes of any type: std::byte, char, std::uint8_t.
template <typename Bytes, typename Number>
void appendLittleEndian(Bytes& bytes, Number value) {
  for (const std::byte byte : littleEndianBytes(value)) {
    bytes.push_back(static_cast<typename Bytes::value_type>(byte));
  }
}

}  // namespace base
