// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/KeyMap.h"

#include <optional>
#include <string>
#include <string_view>
#include "NANDInfo/vocabulary/CounterLists.h"

namespace NANDInfo {

namespace {

struct KeyMap {
  NameTable counters;
  std::vector<std::string> keys;  // of the counters, in their order
};

const KeyMap& keyMap() {
  static const KeyMap map = [] {
    std::vector<NameRow> counters;
    std::vector<std::string> keys;
    for (const FTLCounter& row : FTLCounters()) {
      if (row.serviceKey == nullptr) continue;
      const KeyMapRow names = keyMapRow(row);
      counters.push_back(names.counters);
      for (const std::string& suffix : expandNames(names.suffixes)) {
        keys.push_back("com.norba.NANDInfo." + suffix);
      }
    }
    return KeyMap{NameTable(counters), std::move(keys)};
  }();
  return map;
}

}  // namespace

std::optional<std::string_view> keyMapKey(std::string_view counter) {
  const KeyMap& map = keyMap();
  const NameTable::Entry* const entry = map.counters.find(counter);
  if (entry == nullptr) return std::nullopt;
  return map.keys[static_cast<std::size_t>(entry - map.counters.begin())];
}

std::vector<KeyMapEntry> keyMapEntries() {
  const KeyMap& map = keyMap();
  std::vector<KeyMapEntry> entries;
  for (const NameTable::Entry& entry : map.counters) {
    entries.push_back({entry.name, map.keys[entries.size()]});
  }
  return entries;
}

}  // namespace NANDInfo
