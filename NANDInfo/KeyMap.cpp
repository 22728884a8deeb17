#include "NANDInfo/NameRows.h"
#include "NANDInfo/Whitelists.h"

namespace NANDInfo {

namespace {

platform::Dictionary keyMap() {
  const std::string prefix = "com.norba.NANDInfo.";
  platform::Dictionary map;
  for (const KeyMapRow& row : keyMapRows()) {
    const std::vector<std::string> suffixes = expandFamily(row.suffixes);
    auto suffix = suffixes.begin();
    for (std::string& counter : expandFamily(row.counters)) {
      map.set(std::move(counter), prefix + *suffix++);
    }
  }
  return map;
}

}  // namespace

std::optional<std::string_view> keyMapKey(std::string_view counter) {
  static const platform::Dictionary map = keyMap();
  const std::string* const key = map.text(counter);
  if (key == nullptr) return std::nullopt;
  return *key;
}

}  // namespace NANDInfo
