#include "NANDInfo/Whitelists.h"
#include "NANDInfo/vocabulary/NameRows.h"

namespace NANDInfo {

namespace {

struct KeyMap {
  NameTable counters;
  std::vector<std::string> keys;  // of the counters, in their order
};

KeyMap keyMap() {
  std::vector<NameRow> counters;
  std::vector<std::string> keys;
  for (const KeyMapRow& row : keyMapRows()) {
    counters.push_back({row.counters, 0});
    for (std::string& key : expandFamily(std::string("com.norba.NANDInfo.") + row.suffixes)) {
      keys.push_back(std::move(key));
    }
  }
  return {NameTable(counters), std::move(keys)};
}

}  // namespace

std::optional<std::string_view> keyMapKey(std::string_view counter) {
  static const KeyMap map = keyMap();
  const NameTable::Entry* const entry = map.counters.find(counter);
  if (entry == nullptr) return std::nullopt;
  return map.keys[static_cast<std::size_t>(entry - map.counters.begin())];
}

}  // namespace NANDInfo
