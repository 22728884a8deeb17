// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "plist/BinaryReader.h"

#include "PropertyListRoundTrip.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size) {
  fuzz::checkRoundTrip(plist::readBinary, bytes, size);
  return 0;
}
