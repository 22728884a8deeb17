// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The decoders of the controller's counter buffers. All only append to the context; what is wrong
// with a buffer goes to SetAPIErrorMessage.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <span>

#include "NANDInfo/GenericParserContext.h"

namespace MORVEND_EXPORTED NANDInfo {

// FTL statistics: records of 64-bit words, up to an end key or a record that the buffer can't hold.
// A key of the table is published under its name, an array as "name_0", "name_1" and so on (one
// whose record holds a single element as "name_"), any other key as if its name were "Stat_<key>".
// Returns the number of values added; 0 is a failed parse.
std::uint32_t ZMCFTLParseBufferToCxt(GenericParserCxt* context, std::span<const std::byte> buffer);

// The same with every key under "Stat_<key>".
std::uint32_t ZMCFTLParseStatKeyBufferToCxt(GenericParserCxt* context,
                                            std::span<const std::byte> buffer);

// MSP statistics: records of tag, length and elements, unaligned. Array elements are published
// under the name directly followed by the index; tags that are not in the table are passed over.
// Returns the number of elements added; 0 is a failed parse.
std::uint32_t ZMCMSPParseBufferToCxt(GenericParserCxt* context, std::span<const std::byte> buffer);

// What the legacy decoder fills: all fields, and the most used ones for direct reading.
struct LegacyNandInfoCxt {
  GenericParserCxt fields;
  std::uint32_t exportVersion = 0;
  std::uint32_t driverVersion = 0;
  std::uint32_t numVirtualBlocks = 0;
  std::uint32_t blocksPerVirtualBlock = 0;
  std::uint32_t pagesPerVirtualBlock = 0;
  std::uint32_t bytesPerPage = 0;
  std::uint64_t hostReads = 0;
  std::uint64_t hostWrites = 0;
  std::uint64_t numFreeVirtualBlocks = 0;
  std::uint64_t wearLevMoves = 0;
  std::uint64_t nandReads = 0;
  std::uint64_t nandWrites = 0;
  std::uint64_t bandErases = 0;
  std::uint64_t IND_pool_free = 0;
  std::uint64_t IND_pool_count = 0;
  std::uint64_t utilFormatTime = 0;  // seconds since 1970
  std::uint64_t numSleepOps = 0;
  std::uint64_t maxHighEnduranceBlockErases = 0;
  std::array<std::uint64_t, 5> readCountHisto = {};
};

// The same buffer format in the legacy form: array elements under the name directly followed by the
// index, unknown keys left out. False when the buffer has no header or a bad one; what was read
// before it stays.
bool ZMCParseBufferToCxt(LegacyNandInfoCxt* context, std::span<const std::byte> buffer);

// Frees the fields and sets everything to 0.
void ZMCReleaseContext(LegacyNandInfoCxt* context);

}  // namespace NANDInfo
