// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Lists as the storage controller delivers them, put together by hand.
#pragma once

#include <cstdint>
#include <utility>
#include <vector>

#include "support/ControllerBuffers.h"

namespace support {

inline Bytes words32(const std::vector<std::uint32_t>& all) {
  Bytes bytes;
  for (const std::uint32_t word : all) put(bytes, word, 4);
  return bytes;
}

// Records of list index and value behind a header of `headerUnits` times 8 bytes.
inline Bytes validityList(std::uint32_t headerUnits,
                          const std::vector<std::pair<std::uint32_t, std::uint32_t>>& records) {
  Bytes bytes = words32({static_cast<std::uint32_t>(records.size()), headerUnits});
  bytes.resize(8 * headerUnits, std::byte{0xEE});
  for (const auto& [list, value] : records) {
    // What isn't read is not 0.
    for (const std::uint32_t word : {~0u, ~0u, ~0u}) put(bytes, word, 4);
    put(bytes, list, 4);
    put(bytes, value, 4);
  }
  return bytes;
}

// Word k of channel c's block is 1000 * c + k, the fields of its summary are 100 * c and those that
// follow.
inline Bytes telemetryList(std::uint32_t channels) {
  Bytes bytes;
  for (std::uint32_t c = 0; c < channels; ++c) {
    for (std::uint32_t k = 0; k < 1024; ++k) put(bytes, 1000 * c + k, 4);
  }
  for (std::uint32_t c = 0; c < channels; ++c) {
    for (std::uint32_t k = 0; k < 8; ++k) put(bytes, 100 * c + k, 4);
  }
  return bytes;
}

// Records of eight words each.
inline Bytes defectsList(std::uint32_t factoryCount,
                         const std::vector<std::vector<std::uint32_t>>& records) {
  Bytes bytes = words32({~0u, factoryCount, static_cast<std::uint32_t>(records.size())});
  for (const auto& record : records) {
    const Bytes part = words32(record);
    bytes.insert(bytes.end(), part.begin(), part.end());
  }
  return bytes;
}

}  // namespace support
