// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "base/CivilDate.h"

#include <algorithm>
#include <cmath>

#include "base/Convert.h"

namespace base {

namespace {

constexpr std::int64_t kDaysPerEra = 146097;  // 400 years
constexpr std::int64_t kEpochShift = 719468;  // days from 0000-03-01 to 1970-01-01

std::int64_t floorDivide(std::int64_t a, std::int64_t b) { return a / b - (a % b < 0 ? 1 : 0); }

}  // namespace

// By hand, because a clock may be off by more than the 32,767 years that <chrono> can name. Years
// are counted from March, so that the leap day is the last of its year.
CivilDate civilFromDays(std::int64_t daysSince1970) {
  const std::int64_t shifted = daysSince1970 + kEpochShift;
  const std::int64_t era = floorDivide(shifted, kDaysPerEra);
  const std::int64_t dayOfEra = shifted - era * kDaysPerEra;
  const std::int64_t yearOfEra =
      (dayOfEra - dayOfEra / 1460 + dayOfEra / 36524 - dayOfEra / 146096) / 365;
  const std::int64_t dayOfYear = dayOfEra - (365 * yearOfEra + yearOfEra / 4 - yearOfEra / 100);
  const std::int64_t monthFromMarch = (5 * dayOfYear + 2) / 153;
  const int day = static_cast<int>(dayOfYear - (153 * monthFromMarch + 2) / 5 + 1);
  const int month = static_cast<int>(monthFromMarch < 10 ? monthFromMarch + 3 : monthFromMarch - 9);
  return {yearOfEra + era * 400 + (month <= 2 ? 1 : 0), month, day};
}

std::int64_t daysFromCivil(const CivilDate& date) {
  const std::int64_t year = date.year - (date.month <= 2 ? 1 : 0);
  const std::int64_t era = floorDivide(year, 400);
  const std::int64_t yearOfEra = year - era * 400;
  const std::int64_t monthFromMarch = date.month > 2 ? date.month - 3 : date.month + 9;
  const std::int64_t dayOfYear = (153 * monthFromMarch + 2) / 5 + date.day - 1;
  const std::int64_t dayOfEra = yearOfEra * 365 + yearOfEra / 4 - yearOfEra / 100 + dayOfYear;
  return era * kDaysPerEra + dayOfEra - kEpochShift;
}

CivilTime civilFromSeconds(double secondsSince1970) {
  const auto seconds =
      saturatingCast<std::int64_t>(std::clamp(std::floor(secondsSince1970), -1e14, 1e14));
  const std::int64_t day = floorDivide(seconds, kSecondsPerDay);
  const int second = static_cast<int>(seconds - day * kSecondsPerDay);
  return {civilFromDays(day), second / 3600, second / 60 % 60, second % 60};
}

std::int32_t dayNumber(double secondsSince1970) {
  return saturatingCast<std::int32_t>(
      std::floor(secondsSince1970 / static_cast<double>(kSecondsPerDay)));
}

}  // namespace base
