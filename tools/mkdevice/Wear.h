// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The life of an imaginary flash device: what its controller counts. A device is formatted on a
// day that its seed decides, and wears a little every hour; whatever is counted at an earlier hour
// is never more than at a later one.
#pragma once

#include <cstdint>
#include <span>
#include <string_view>
#include <vector>

#include "tools/mkdevice/Sample.h"

namespace mkdevice {

// The geometry of the device: 128 GiB in bands of 288 MiB.
inline constexpr std::uint64_t kBytesPerPage = 16384;
inline constexpr std::uint64_t kPagesPerBand = 18432;
inline constexpr std::uint64_t kPagesPerFastBand = 6144;
inline constexpr std::uint64_t kBands = 496;
inline constexpr std::uint64_t kFirstFastBand = 4;
inline constexpr std::uint64_t kFirstUserBand = 24;
inline constexpr std::uint64_t kFactoryBadBlocks = 37;
inline constexpr std::uint64_t kHoursPerBadBlock = 3000;
inline constexpr std::uint64_t kHoursPerBoot = 200;
inline constexpr std::uint64_t kNANDDescription = 0x4E31;

// The state of the device at one hour. Writes and reads count sectors of 4 KiB.
struct Wear {
  Wear(const Sample& sample, int hoursAgo);

  std::uint64_t seed;
  std::uint64_t formatTime, time;  // seconds since 1970
  std::uint64_t hours;             // since it was formatted
  std::uint64_t magazineMeta;      // the time in bits 24 to 55, a serial number below
  std::uint64_t hostWrites, hostReads, nandWrites, nandReads;
  std::uint64_t bandErases, fastBandErases;
  std::uint64_t cycles, fastCycles;  // on average for each band

  // The device is started anew every kHoursPerBoot hours.
  std::uint64_t boot() const { return hours / kHoursPerBoot; }
  std::uint64_t hoursSinceBoot() const { return hours % kHoursPerBoot; }

  // What happens so many times a day has happened so often by now.
  std::uint64_t sinceFormat(double perDay) const;
};

// A counter that the wear decides: base + source * multiplier / divisor, at most `most`.
struct WearCounter {
  const char* name;
  std::uint64_t base;
  std::uint64_t Wear::*source = nullptr;
  std::uint64_t multiplier = 1, divisor = 1;
  std::uint64_t most = UINT64_MAX;
};
std::span<const WearCounter> wearCounterTable();

// What the other counters are like, by a part of their names.
enum class Growth {
  counted,  // grows by the figure every day; a histogram's later elements are smaller
  bell,     // a histogram that grows by the figure every day, most of it in the middle
  level,    // always near the figure
};
struct CounterFamily {
  const char* part;  // of the name; the first row whose part a name holds describes it
  Growth growth;
  double figure;
};
std::span<const CounterFamily> counterFamilyTable();

// The elements of a counter; `unit` tells equal counters of several units apart.
std::vector<std::uint64_t> counterValues(const Wear& wear, std::string_view name,
                                         std::size_t elements, std::uint64_t unit = 0);

}  // namespace mkdevice
