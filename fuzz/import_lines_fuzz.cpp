// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Lines of an import.
#include <cmath>
#include <cstdlib>
#include <string_view>

#include "tools/pelloran/Arguments.h"
#include "tools/pelloran/ImportLine.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size) {
  const std::string_view line(reinterpret_cast<const char*>(bytes), size);
  const auto parsed = pelloran::parseImportLine(line, {20000, 3600});
  if (!parsed) {
    if (parsed.error().text.empty()) std::abort();
    return 0;
  }
  if (!pelloran::checkKey(parsed->key)) std::abort();
  if (!std::isfinite(parsed->change.sample)) std::abort();
  if (parsed->change.seconds < 0 || parsed->change.seconds >= 86400) std::abort();
  return 0;
}
