// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What can be made of a captured buffer by the name of its kind: one row a kind.
#pragma once

#include <cstdint>
#include <span>
#include <string>

#include "NANDInfo/queries/DecodedBuffer.h"
#include "NANDInfo/queries/Outcome.h"
#include "NANDInfo/queries/Queries.h"

namespace NANDInfo {

struct BufferOptions {
  std::string layout;          // the name of a counter layout
  std::uint32_t channels = 0;  // of the controller; 0 if it isn't known
};

// The options that a kind takes: the layout, which there must be; the channels.
enum BufferTakes : std::uint16_t {
  kLayout = kQueryTakesEnd,
  kChannels = kLayout << 1,
  kBufferTakesEnd = kLayout << 2,  // who has further options counts them from here
};

struct BufferDecoder {
  const char* kind;
  const char* description;
  std::uint16_t takes;  // of BufferTakes
  // What DecodedBuffer.h says; with an error if nothing could be decoded. Of the kind "counters"
  // the words of the common layout, from the first counter block: bytes that end after the words
  // that the layout reads are taken for the rest as zeros.
  Outcome (*decode)(Bytes bytes, const BufferOptions& options);
};

std::span<const BufferDecoder> bufferDecoders();

}  // namespace NANDInfo
