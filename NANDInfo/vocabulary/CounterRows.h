// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The tables of the counters: one row says all that the system knows of one. Every list of names
// that may leave the device is derived from them (CounterLists.h); their order says nothing unless
// it is said here.
#pragma once

#include <algorithm>
#include <array>
#include <cstdint>
#include <span>
#include <string_view>

#include "NANDInfo/KeyTables.h"

namespace NANDInfo {

// Where a counter may go. In a table, what follows from the rest of a row isn't said again.
enum CounterList : std::uint16_t {
  // The whitelists.
  kFTL = 1 << 0,
  kMSP = 1 << 1,
  kStorage = 1 << 2,

  // The stats magazine: what a counter grew by, or how it stood; all that may be reported.
  kAccum = 1 << 3,
  kDynamic = 1 << 4,
  kMagazine = 1 << 5,

  // The analytics events. The weekly and the monthly one of the magazine are alike.
  kCounters = 1 << 6,
  kHistograms = 1 << 7,
  kHistograms2 = 1 << 8,
  kMSPEvent = 1 << 9,
  kStorageEvent = 1 << 10,
  kDaily = 1 << 11,
  kLonger = 1 << 12,
  kWindows = kDaily | kLonger,

  // The derived fields that go with the MSP and storage statistics.
  kAlong = 1 << 13,
};

// The digits of a counter that is in no whitelist.
inline constexpr std::uint8_t kNoDigits = 0xFF;

// Keys of the counters service: none, or the counter's own name.
inline constexpr char kNone[] = "-";
inline constexpr char kSame[] = "";

// A counter of the FTL statistics. Names of an array's elements end in "_" and the index, those of
// the legacy dictionary in the index alone.
struct FTLCounter : FTLKey {
  constexpr FTLCounter(std::uint16_t itsKey, std::uint16_t size, const char* itsName,
                       std::uint8_t significantDigits = kNoDigits, std::uint16_t goesTo = 0,
                       const char* suffix = kNone, const char* part = nullptr)
      : FTLKey{itsKey, size, itsName},
        digits(significantDigits),
        lists(static_cast<std::uint16_t>(goesTo | (digits != kNoDigits ? kFTL : 0) |
                                         (goesTo & (kAccum | kDynamic) ? kMagazine : 0))),
        serviceKey(*suffix == *kNone   ? nullptr
                   : *suffix == *kSame ? itsName
                                       : suffix),
        only(part) {}

  std::uint8_t digits;  // a counter that has some is in the whitelist
  std::uint16_t lists;  // of CounterList; one that accumulates or is dynamic is in kMagazine, too

  // The suffix of its key at the counters service, or null. For an array a family of suffixes, for
  // as many elements as it has; or a text that is followed by the same index.
  const char* serviceKey;

  // The elements of an array for which all this holds, such as "{0..2, 4}"; null: for each.
  const char* only;
};

// A counter of an MSP's statistics. Names of an array's elements end in the index. Each is in the
// whitelist.
struct MSPCounter : MSPTag {
  constexpr MSPCounter(std::uint16_t itsTag, std::uint8_t itsWidth, std::uint8_t size,
                       const char* itsName, std::uint8_t significantDigits,
                       std::uint16_t goesTo = kMSPEvent)
      : MSPTag{itsTag, itsWidth, size, itsName},
        digits(significantDigits),
        lists(static_cast<std::uint16_t>(goesTo | kMSP)) {}

  std::uint8_t digits;
  std::uint16_t lists;
};

// What no buffer holds under a key of its own, or goes elsewhere than the rest of its array.
struct NamedCounter {
  const char* family;
  std::uint8_t digits;
  std::uint16_t lists;  // all of them
};

// Whether no two rows have the same text.
template <typename Row, std::size_t count, typename Text>
constexpr bool areUnique(const Row (&rows)[count], Text text) {
  std::array<std::string_view, count> texts;
  std::ranges::transform(
      rows, texts.begin(), [](const char* t) { return t; }, text);
  std::ranges::sort(texts);
  return std::ranges::adjacent_find(texts) == texts.end();
}

std::span<const FTLCounter> FTLCounters();        // by key
std::span<const MSPCounter> MSPCounters();        // by tag
std::span<const NamedCounter> storageCounters();  // those of kAlong in the order of the fields

}  // namespace NANDInfo
