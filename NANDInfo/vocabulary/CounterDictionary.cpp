// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/CounterDictionary.h"

#include <algorithm>
#include <unordered_set>

#include "NANDInfo/Events.h"
#include "NANDInfo/KeyMap.h"
#include "NANDInfo/Whitelists.h"
#include "NANDInfo/vocabulary/CounterLists.h"

namespace NANDInfo {

namespace {

constexpr struct {
  std::string_view name;
  const NameTable& (*table)();
} kWhitelists[] = {{"FTL", WhitelistedRawNANDFTLCounters_SigDigDict},
                   {"MSP", WhitelistedRawNANDMSPCounters_SigDigDict},
                   {"storage", WhitelistedStorageStats_SigDigDict},
                   {"magazine", PrivacyApprovedSMagNANDFTLCounters_SigDigDict}};

void addLists(CounterEntry& entry) {
  for (const auto& [name, table] : kWhitelists) {
    const NameTable::Entry* const listed = table().find(entry.name);
    if (listed == nullptr) continue;
    entry.digits = listed->number;
    entry.whitelists.push_back(name);
  }
  if (PrivacyApprovedSMagNANDFTLCounters_Accum().contains(entry.name)) {
    entry.magazine = "accumulated";
  } else if (PrivacyApprovedSMagNANDFTLCounters_Dynamic().contains(entry.name)) {
    entry.magazine = "dynamic";
  }
  for (const EventView& event : eventViews()) {
    if (event.fields().contains(entry.name)) entry.events.push_back(event.view);
  }
}

// Under its legacy name.
void addCountersKey(CounterEntry& entry) {
  std::string name = entry.name;
  if (!entry.array.empty()) name = std::string(entry.array) + std::to_string(entry.index);
  entry.countersKey = keyMapKey(name).value_or("");
}

// The names of a row and, for the elements of an array, the array and the index.
std::vector<CounterEntry> namesOf(NameRow row, CounterEntry::Buffer buffer, std::uint32_t key) {
  row.items = nullptr;  // all of them, also those that go nowhere
  std::string_view array = familyStem(row.family);
  if (array.ends_with('_')) array.remove_suffix(1);
  std::vector<CounterEntry> entries;
  const auto names = expandNames(row);
  visitItems(row, [&](const FamilyItem& item) {
    for (std::uint32_t i = 0; i < std::max(item.count, 1u); ++i) {
      CounterEntry& entry = entries.emplace_back();
      entry.name = names[entries.size() - 1];
      if (item.count > 0) {
        entry.array = array;
        entry.index = item.first + i;
      }
      entry.buffer = buffer;
      entry.key = key;
      entry.elements = static_cast<std::uint32_t>(names.size());
    }
  });
  return entries;
}

}  // namespace

std::vector<CounterEntry> counterDictionary() {
  using Buffer = CounterEntry::Buffer;
  std::vector<CounterEntry> dictionary;
  std::unordered_set<std::string> known;
  const auto add = [&](std::vector<CounterEntry> entries) {
    for (CounterEntry& entry : entries) {
      // An element that goes elsewhere than its array has a row of its own, but it isn't another.
      if (!known.insert(entry.name).second && entry.buffer == Buffer::none) continue;
      addLists(entry);
      if (entry.buffer == Buffer::FTL) addCountersKey(entry);
      dictionary.push_back(std::move(entry));
    }
  };
  for (const FTLCounter& row : FTLCounters()) add(namesOf(namesOf(row), Buffer::FTL, row.key));
  for (const MSPCounter& row : MSPCounters()) add(namesOf(namesOf(row), Buffer::MSP, row.tag));
  for (const NamedCounter& row : storageCounters()) add(namesOf(namesOf(row), Buffer::none, 0));
  return dictionary;
}

}  // namespace NANDInfo
