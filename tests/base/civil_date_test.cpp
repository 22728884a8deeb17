// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "base/CivilDate.h"

#include <gtest/gtest.h>

#include <chrono>
#include <limits>
#include <random>

namespace platform {
namespace {

// Every day of the 400 years after which the calendar repeats itself, around the years 2000 and 0
// and somewhere in the whole range.
TEST(CivilDate, IsTheStandardLibrarysInEveryEra) {
  constexpr std::int64_t kDaysOfAnEra = 146097;
  std::mt19937_64 random(1);
  for (std::int64_t day = 0; day < kDaysOfAnEra; ++day) {
    const std::chrono::year_month_day known{std::chrono::sys_days(std::chrono::days(day))};
    const int month = static_cast<int>(unsigned{known.month()});
    const int dayOfMonth = static_cast<int>(unsigned{known.day()});
    const std::int64_t far = static_cast<std::int64_t>(random() >> (32 + day % 30));
    for (const std::int64_t era : {std::int64_t{0}, std::int64_t{-5}, far, -far}) {
      const base::CivilDate date{int{known.year()} + 400 * era, month, dayOfMonth};
      ASSERT_EQ(base::civilFromDays(day + era * kDaysOfAnEra), date) << day << " " << era;
      ASSERT_EQ(base::daysFromCivil(date), day + era * kDaysOfAnEra);
    }
  }
}

TEST(CivilDate, SecondsRoundDownAndSaturate) {
  EXPECT_EQ(base::civilFromSeconds(-0.5), (base::CivilTime{{1969, 12, 31}, 23, 59, 59}));
  EXPECT_EQ(base::civilFromSeconds(86399.999), (base::CivilTime{{1970, 1, 1}, 23, 59, 59}));
  const double infinity = std::numeric_limits<double>::infinity();
  EXPECT_EQ(base::civilFromSeconds(infinity), base::civilFromSeconds(1e14));
  EXPECT_EQ(base::civilFromSeconds(-1e300), base::civilFromSeconds(-1e14));
  EXPECT_EQ(base::civilFromSeconds(std::numeric_limits<double>::quiet_NaN()),
            base::civilFromSeconds(0));
}

TEST(CivilDate, DayNumbersStayWithin32Bits) {
  EXPECT_EQ(base::dayNumber(-1), -1);
  EXPECT_EQ(base::dayNumber(86400), 1);
  EXPECT_EQ(base::dayNumber(1e300), INT32_MAX);
  EXPECT_EQ(base::dayNumber(-1e300), INT32_MIN);
  EXPECT_EQ(base::dayBefore(0), -1);
  EXPECT_EQ(base::dayBefore(INT32_MIN), INT32_MIN);
}

}  // namespace
}  // namespace platform
