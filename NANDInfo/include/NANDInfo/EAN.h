// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The EAN service's images: which are asked for, and under which key each answer is reported.
#pragma once

#include <cstdint>
#include <span>

#include "NANDInfo/Services.h"
#include "base/Exported.h"

namespace MORVEND_EXPORTED NANDInfo {

// The size of an image in bytes, and the number of its updates, by its four-character code (the
// first character in the highest byte). 0 on any failure, with a line in the log.
std::uint64_t GetEANImageSize(const Services& services, std::uint32_t code);
std::uint64_t GetEANUpdateCount(const Services& services, std::uint32_t code);

// What they ask the driver of the service.
inline constexpr char kEANClassName[] = "NorbaNVMeEAN";
inline constexpr std::uint32_t kEANImageSizeMethod = 3, kEANUpdateCountMethod = 7;

enum class EANFigure : std::uint8_t { imageSize, updateCount };

struct EANQuery {
  const char* key;  // of the storage statistics
  EANFigure figure;
  std::uint32_t code;
};

// In the order in which the storage statistics ask.
std::span<const EANQuery> EANQueries();

}  // namespace NANDInfo
