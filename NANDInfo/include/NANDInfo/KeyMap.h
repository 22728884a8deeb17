// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Which legacy counters the counters service knows, and under which key.
#pragma once

#include <optional>
#include <string_view>
#include <vector>

#include "base/Exported.h"

namespace MORVEND_EXPORTED NANDInfo {

// The counters service's key of a legacy counter ("com.norba.NANDInfo." and a suffix), or none.
std::optional<std::string_view> keyMapKey(std::string_view counter);

// Every legacy counter that has such a key.
struct KeyMapEntry {
  std::string_view counter, key;
};
std::vector<KeyMapEntry> keyMapEntries();

}  // namespace NANDInfo
