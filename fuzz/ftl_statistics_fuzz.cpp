// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// FTL statistics, by name and by key.

#include "CounterDecoder.h"
#include "NANDInfo/FTLDecoder.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  const auto bytes = std::as_bytes(std::span(data, size));
  const auto named = fuzz::checkDecoder(NANDInfo::decodeFTL, bytes, 8);
  const auto byKey = fuzz::checkDecoder(NANDInfo::decodeFTLByKey, bytes, 8);
  // Both walk the same records; the table only takes values away.
  fuzz::require(named.size() <= byKey.size() && named.empty() == byKey.empty());
  for (const auto& field : byKey) fuzz::require(field.first.starts_with("Stat_"));
  return 0;
}
