// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Messages of the bus as dictionaries.
//
// A message comes from anyone, so what it may cost is bounded, whatever its size and its types.
#pragma once

#include <systemd/sd-bus.h>

#include <cstddef>
#include <optional>

#include "plist/Value.h"

namespace host {

inline constexpr std::size_t kMaxElements = 4096;               // of one array or dictionary
inline constexpr std::size_t kMaxValues = 65536;                // of a message, in all
inline constexpr std::size_t kMaxBytes = std::size_t{1} << 20;  // of texts, keys and data, in all
inline constexpr int kMaxNesting = 64;                          // of arrays, dictionaries, variants

struct BusDictionary {
  plist::Dictionary dictionary;
  std::size_t dropped = 0;  // values left out because they were beyond a limit
};

// Reads a message whose body is a{sv}, from the start. None when the body contradicts its
// signature.
//
// Integers of every type become int64, or uint64 where they are larger; booleans, doubles and texts
// (object paths and signatures too) stay what they are, but that what can't be written becomes
// U+FFFD; of keys that become the same the last counts. ay is data, other arrays are arrays, and a
// variant is what it holds. Values of other types are left out.
std::optional<BusDictionary> readDictionary(sd_bus_message* message);

}  // namespace host
