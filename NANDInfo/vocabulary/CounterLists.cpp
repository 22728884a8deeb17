// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/vocabulary/CounterLists.h"

namespace NANDInfo {

std::vector<NameRow> namesOn(CounterList list) {
  std::vector<NameRow> names;
  const auto add = [&names, list](const auto& rows) {
    for (const auto& row : rows) {
      if ((row.lists & list) != 0) names.push_back(namesOf(row));
    }
  };
  add(FTLCounters());
  add(MSPCounters());
  add(storageCounters());
  return names;
}

std::vector<FTLKey> FTLKeyTable() {
  const auto rows = FTLCounters();
  return {rows.begin(), rows.end()};
}

std::vector<MSPTag> MSPTagTable() {
  const auto rows = MSPCounters();
  return {rows.begin(), rows.end()};
}

}  // namespace NANDInfo
