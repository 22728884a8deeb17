// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The vocabulary of the counter buffers: which key or tag stands for which name, and how many
// elements it is configured for.
#pragma once

#include <cstdint>
#include <vector>

#include "base/Exported.h"

namespace MORVEND_EXPORTED NANDInfo {

// A key of the FTL statistics buffer. Elements are 64-bit words; one element is a single value.
struct FTLKey {
  std::uint16_t key;
  std::uint16_t elements;
  const char* name;
};

// All of them, ordered by key.
std::vector<FTLKey> FTLKeyTable();

// The row of a key, or null.
const FTLKey* findFTLKey(std::uint32_t key);

// A tag of the MSP statistics buffer.
struct MSPTag {
  std::uint16_t tag;
  std::uint8_t width;  // of an element: 4 or 8 bytes
  std::uint8_t elements;
  const char* name;
};

// All of them, ordered by tag.
std::vector<MSPTag> MSPTagTable();

// The row of a tag, or null.
const MSPTag* findMSPTag(std::uint32_t tag);

}  // namespace NANDInfo
