#include "platform/CivilDate.h"

#include <gtest/gtest.h>

#include <limits>
#include <random>

namespace platform {
namespace {

TEST(CivilDate, KnownDays) {
  struct Row {
    std::int64_t day;
    CivilDate date;
  };
  for (const Row& row : {
           Row{0, {1970, 1, 1}},
           Row{-1, {1969, 12, 31}},
           Row{11016, {2000, 2, 29}},
           Row{11017, {2000, 3, 1}},
           Row{-25509, {1900, 2, 28}},
           Row{-25508, {1900, 3, 1}},
           Row{20779, {2026, 11, 22}},
           Row{-719468, {0, 3, 1}},
           Row{-719469, {0, 2, 29}},
           Row{-719529, {-1, 12, 31}},
           Row{2932896, {9999, 12, 31}},
           Row{-865566, {-400, 2, 29}},
       }) {
    EXPECT_EQ(civilFromDays(row.day), row.date) << row.day;
    EXPECT_EQ(daysFromCivil(row.date), row.day);
  }
}

bool follows(const CivilDate& next, const CivilDate& date) {
  if (next.day > 1)
    return next.day == date.day + 1 && next.month == date.month && next.year == date.year;
  if (next.month > 1)
    return date.day >= 28 && next.month == date.month + 1 && next.year == date.year;
  return date.month == 12 && date.day == 31 && next.year == date.year + 1;
}

// Every day of 800 years around the year 0, and single days up to the limit of the range.
TEST(CivilDate, DaysFollowOneAnotherAndComeBack) {
  for (std::int64_t day = -719468 - 146097; day < -719468 + 146097; ++day) {
    const CivilDate date = civilFromDays(day);
    ASSERT_EQ(daysFromCivil(date), day);
    ASSERT_TRUE(follows(civilFromDays(day + 1), date)) << day;
  }
  std::mt19937_64 random(1);
  for (int i = 0; i < 20000; ++i) {
    const auto day = static_cast<std::int64_t>(random() >> (14 + i % 40)) * (i % 2 == 0 ? 1 : -1);
    const CivilDate date = civilFromDays(day);
    ASSERT_EQ(daysFromCivil(date), day);
    ASSERT_TRUE(follows(civilFromDays(day + 1), date)) << day;
  }
}

TEST(CivilDate, SecondsRoundDownAndSaturate) {
  EXPECT_EQ(civilFromSeconds(-0.5), (CivilTime{{1969, 12, 31}, 23, 59, 59}));
  EXPECT_EQ(civilFromSeconds(86399.999), (CivilTime{{1970, 1, 1}, 23, 59, 59}));
  const double infinity = std::numeric_limits<double>::infinity();
  EXPECT_EQ(civilFromSeconds(infinity), civilFromSeconds(1e14));
  EXPECT_EQ(civilFromSeconds(-1e300), civilFromSeconds(-1e14));
  EXPECT_EQ(civilFromSeconds(std::numeric_limits<double>::quiet_NaN()), civilFromSeconds(0));
}

TEST(CivilDate, DayNumbersStayWithin32Bits) {
  EXPECT_EQ(dayNumber(-1), -1);
  EXPECT_EQ(dayNumber(86400), 1);
  EXPECT_EQ(dayNumber(1e300), INT32_MAX);
  EXPECT_EQ(dayNumber(-1e300), INT32_MIN);
  EXPECT_EQ(dayBefore(0), -1);
  EXPECT_EQ(dayBefore(INT32_MIN), INT32_MIN);
}

}  // namespace
}  // namespace platform
