// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The records of an FTL statistics buffer: a header word (key in the low half, number of values in
// the high half), then that many 64-bit values.
#pragma once

#include <cstdint>
#include <optional>

#include "base/ByteReader.h"

namespace NANDInfo {

struct FTLHeader {
  std::uint32_t key, count;
};

// A larger key is no key.
inline constexpr std::uint32_t kMaxFTLKey = 0x30000000;
inline constexpr std::uint32_t kFTLValueSize = 8;

// The next header; none when no whole word is left.
inline std::optional<FTLHeader> readFTLHeader(base::ByteReader& words) {
  const auto word = words.read<std::uint64_t>();
  if (!word) return std::nullopt;
  return FTLHeader{static_cast<std::uint32_t>(*word), static_cast<std::uint32_t>(*word >> 32)};
}

// The values that follow the header; none when there are fewer.
inline std::optional<std::span<const std::byte>> takeFTLValues(base::ByteReader& words,
                                                               const FTLHeader& header) {
  return words.take(std::uint64_t{header.count} * kFTLValueSize);
}

}  // namespace NANDInfo
