// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Day numbers and calendar dates: the proleptic Gregorian calendar in UTC, any year.
#pragma once

#include <cstdint>

#include "base/Exported.h"

namespace MORVEND_EXPORTED base {

inline constexpr std::int64_t kSecondsPerDay = 86400;

struct CivilDate {
  std::int64_t year;
  int month;  // 1 to 12
  int day;    // 1 to 31
  bool operator==(const CivilDate&) const = default;
};

struct CivilTime {
  CivilDate date;
  int hour, minute, second;
  bool operator==(const CivilTime&) const = default;
};

// Both hold for every day number of magnitude below 2^50.
CivilDate civilFromDays(std::int64_t daysSince1970);
std::int64_t daysFromCivil(const CivilDate& date);

// Whole seconds; fractions are rounded down, and what is beyond 10^14 seconds saturates.
CivilTime civilFromSeconds(double secondsSince1970);

// Floor of the seconds over a day, saturating to 32 bits.
std::int32_t dayNumber(double secondsSince1970);

// One day back, staying at the first day that 32 bits can name.
constexpr std::int32_t dayBefore(std::int32_t day) { return day == INT32_MIN ? day : day - 1; }

}  // namespace base
