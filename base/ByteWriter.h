// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Numbers appended as little-endian bytes: what ByteReader reads.
#pragma once

#include <array>
#include <bit>
#include <cstddef>

namespace base {

// An integer or a real number, to bytes of any type: std::byte, char, std::uint8_t.
template <typename Bytes, typename Number>
void appendLittleEndian(Bytes& bytes, Number value) {
  static_assert(std::endian::native == std::endian::little);
  for (const std::byte byte : std::bit_cast<std::array<std::byte, sizeof(Number)>>(value)) {
    bytes.push_back(static_cast<typename Bytes::value_type>(byte));
  }
}

}  // namespace base
