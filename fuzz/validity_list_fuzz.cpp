// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Validity lists: what is kept came from records that lie within the buffer.
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <span>

#include "NANDInfo/ValidityList.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size) {
  const auto lists = NANDInfo::parseValidityList(std::as_bytes(std::span(bytes, size)));
  if (!lists) return 0;
  std::size_t values = 0;
  for (const auto& list : *lists) values += list.size();
  std::uint32_t claimed;
  std::memcpy(&claimed, bytes, sizeof claimed);
  if (claimed == 0 || claimed > size / 20 || values > claimed) std::abort();
  return 0;
}
