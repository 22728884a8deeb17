// The rows of the name tables, a file each. Their order says nothing.
#pragma once

#include <cstddef>
#include <span>

#include "NANDInfo/NameTable.h"
#include "NANDInfo/vocabulary/NameFamily.h"

namespace NANDInfo {

// The significant-digits dictionaries; the number is how many digits a counter keeps.
std::span<const NameRow> ftlSignificantDigitsRows();
std::span<const NameRow> mspSignificantDigitsRows();
std::span<const NameRow> storageSignificantDigitsRows();
std::span<const NameRow> magazineAccumulatedSignificantDigitsRows();
std::span<const NameRow> magazineDynamicSignificantDigitsRows();
std::span<const NameRow> magazineSignificantDigitsRows();

// What the analytics events may carry.
std::span<const NameRow> ftlCountersEventRows();
std::span<const NameRow> ftlHistograms1EventRows();
std::span<const NameRow> ftlHistograms2EventRows();
std::span<const NameRow> magazineDailyEventRows();
std::span<const NameRow> magazineLongerEventRows();
std::span<const NameRow> mspCountersEventRows();
std::span<const NameRow> storageStatsEventRows();

// The key map.
struct KeyMapRow {
  const char* counters;             // a family of legacy counters
  const char* suffixes = counters;  // the family of their keys' suffixes, number by number
};
std::span<const KeyMapRow> keyMapRows();

// How many names the rows of a table stand for.
constexpr std::size_t countNames(std::span<const NameRow> rows) {
  std::size_t count = 0;
  for (const NameRow& row : rows) count += familySize(row.family);
  return count;
}
constexpr std::size_t countNames(std::span<const KeyMapRow> rows) {
  std::size_t count = 0;
  for (const KeyMapRow& row : rows) count += familySize(row.counters);
  return count;
}

}  // namespace NANDInfo
