// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "plist/XMLReader.h"

#include "PropertyListRoundTrip.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size) {
  fuzz::checkRoundTrip(plist::readXML, bytes, size);
  return 0;
}
