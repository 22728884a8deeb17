// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The lists of names, derived from the counters' tables.
#pragma once

#include <vector>

#include "NANDInfo/NameTable.h"
#include "NANDInfo/vocabulary/CounterRows.h"
#include "NANDInfo/vocabulary/NameFamily.h"

namespace NANDInfo {

// The names of a counter, with its digits.
constexpr NameRow namesOf(const FTLCounter& row) {
  return {row.name, row.digits, row.elements > 1 ? '_' : '\0', row.elements, row.only};
}
constexpr NameRow namesOf(const MSPCounter& row) {
  return {row.name, row.digits, '\0', row.elements};
}
constexpr NameRow namesOf(const NamedCounter& row) { return {row.family, row.digits}; }

// Those of the counters that are on a list.
std::vector<NameRow> namesOn(CounterList list);

// The same as a table, which is expanded at its first use.
template <CounterList list>
const NameTable& tableOf() {
  static const NameTable table(namesOn(list));
  return table;
}

// The legacy names of a counter that has a key of the counters service, and the suffixes of their
// keys, one after the other. An array has as many as there are suffixes.
struct KeyMapRow {
  NameRow counters, suffixes;
};
constexpr KeyMapRow keyMapRow(const FTLCounter& row) {
  NameRow counters{row.name, 0, '\0', row.elements, row.only};
  if (row.serviceKey == nullptr) return {counters, counters};
  if (!hasBraces(row.serviceKey)) {
    return {counters, {row.serviceKey, 0, '\0', row.elements, row.only}};
  }
  const NameRow suffixes{row.serviceKey};
  if (row.only == nullptr) counters.elements = static_cast<std::uint16_t>(familySize(suffixes));
  return {counters, suffixes};
}

}  // namespace NANDInfo
