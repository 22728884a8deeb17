// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Defects lists: as many records as are claimed and fit.
#include <algorithm>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <span>

#include "NANDInfo/DefectsList.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size) {
  const auto list = NANDInfo::DefectsList::parse(std::as_bytes(std::span(bytes, size)));
  if (static_cast<bool>(list) != (size >= 12)) std::abort();
  if (!list) return 0;
  std::uint32_t claimed;
  std::memcpy(&claimed, bytes + 8, sizeof claimed);
  if (list->size() != std::min<std::size_t>(claimed, (size - 12) / 32)) std::abort();
  for (std::size_t i = 0; i < list->size(); ++i) {
    if (NANDInfo::defectLog((*list)[i]).size() != 8) std::abort();
  }
  return 0;
}
