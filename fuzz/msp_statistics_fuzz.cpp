// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// MSP statistics.

#include "CounterDecoder.h"
#include "NANDInfo/MSPDecoder.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  const auto bytes = std::as_bytes(std::span(data, size));
  fuzz::checkDecoder(NANDInfo::decodeMSP, bytes, 4);
  return 0;
}
