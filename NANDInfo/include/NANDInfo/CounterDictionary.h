// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The dictionary of counters: under which names the controller's statistics and the fields derived
// from them go, and where each of them may go.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "base/Exported.h"

namespace MORVEND_EXPORTED NANDInfo {

// What the system knows of a name.
struct CounterEntry {
  enum class Buffer : std::uint8_t { none, FTL, MSP };

  std::string name;
  std::string_view array;          // of which it is an element, or empty
  std::uint32_t index = 0;         // in the array
  Buffer buffer = Buffer::none;    // that holds it; none: it is derived, or in events only
  std::uint32_t key = 0;           // there: the FTL's key, the MSP's tag
  std::uint32_t elements = 1;      // of the array, or 1
  std::optional<unsigned> digits;  // significant ones that it keeps; none: it stays here
  std::vector<std::string_view> whitelists;  // "FTL", "MSP", "storage", "magazine"
  std::string_view magazine;                 // "accumulated", "dynamic" or neither
  std::vector<std::string_view> events;      // that may carry it, by their view names
  std::string_view countersKey;  // at the counters service, for its legacy name; or empty
};

// Every name: those of the FTL by key, those of an MSP by tag, then the others. A name that two
// tags stand for is there for each.
std::vector<CounterEntry> counterDictionary();

}  // namespace NANDInfo
