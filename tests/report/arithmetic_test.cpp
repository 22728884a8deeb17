// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "report/Arithmetic.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <limits>
#include <random>
#include <string>
#include <vector>

namespace report {
namespace {

using plist::Number;
constexpr auto kMax = std::numeric_limits<std::int64_t>::max();
constexpr auto kMin = std::numeric_limits<std::int64_t>::min();
constexpr double kInfinity = std::numeric_limits<double>::infinity();
const double kNaN = std::nan("");

CounterOptions options(std::optional<std::uint64_t> bucket, std::optional<std::uint64_t> figures) {
  return {bucket, figures, std::nullopt};
}

TEST(RoundScalar, RoundsToBucketsAndFigures) {
  const struct {
    std::int64_t value;
    std::optional<std::uint64_t> bucket, figures;
    std::int64_t expected;
  } rows[] = {
      {123456, {}, {}, 123456},
      {14, 10, {}, 10},
      {15, 10, {}, 20},
      {7, 0, {}, 0},
      {0, 10, {}, 0},
      {7, 1, {}, 7},
      {1, 3, {}, 0},
      {2, 3, {}, 3},
      // Below zero: the nearest multiple, halves upward.
      {-14, 10, {}, -10},
      {-15, 10, {}, -10},
      {-16, 10, {}, -20},
      {-1, 3, {}, 0},
      {-2, 3, {}, -3},
      {-7, 0, {}, 0},
      {kMin, 1, {}, kMin},
      // Intervals of more than half the range, and the wrap that the arithmetic has at its end.
      {kMax, std::uint64_t{1} << 63, {}, kMin},
      {5, ~std::uint64_t{0}, {}, 0},
      {kMax, 10, {}, kMin + 2},
      {123456, {}, 2, 120000},
      {999, {}, 1, 1000},
      {15, {}, 1, 20},
      {-15, {}, 1, -20},
      {5, {}, 0, 10},
      {0, {}, 1, 0},
      {1, {}, 0, 1},
      {4, {}, 0, 0},
      {kMax, {}, 1, 9000000000000000000},
      {kMin, {}, 1, -9000000000000000000},
      // Rounds to 10^19, which 64 bits can't hold.
      {kMax, {}, 0, kMax},
      {1234, 10, 2, 1200},
      {4, 10, 1, 0},
      // The difference of digits and figures wraps: five digits less 2^64 - 1 is six.
      {99999, {}, ~std::uint64_t{0}, 0},
  };
  for (const auto& row : rows) {
    EXPECT_EQ(roundScalar(row.value, options(row.bucket, row.figures)), row.expected)
        << row.value << " bucket " << row.bucket.value_or(999) << " figures "
        << row.figures.value_or(999);
  }
}

TEST(RoundScalar, CountsTheDigitsOfEveryPowerOfTen) {
  std::int64_t power = 1;
  for (std::uint64_t zeros = 0; zeros <= 18; ++zeros) {
    // A power of ten has as many digits as zeros, so it and its neighbour below stay as they are.
    EXPECT_EQ(roundScalar(power, options({}, zeros)), power);
    EXPECT_EQ(roundScalar(power - 1, options({}, zeros)), power - 1);
    // Up to here the logarithm tells the next number from the power.
    if (zeros >= 1 && zeros <= 14) {
      EXPECT_EQ(roundScalar(power + 1, options({}, zeros)), power);
    }
    if (zeros < 18) power *= 10;
  }
}

// The definition, word for word.
std::int64_t significant(std::int64_t value, std::uint64_t figures) {
  const double d = std::ceil(std::log10(std::fabs(static_cast<double>(value))));
  const auto x = static_cast<std::int64_t>(static_cast<std::uint64_t>(d) - figures);
  if (x < 1) return value;
  const double p = std::pow(10, static_cast<double>(x));
  return static_cast<std::int64_t>(p * std::round(static_cast<double>(value) / p));
}

TEST(RoundScalar, AgreesWithTheLogarithmAroundEveryPowerAndAtRandom) {
  std::mt19937_64 random(5);
  std::vector<std::int64_t> values;
  for (std::int64_t power = 10; power <= 100'000'000'000'000'000; power *= 10) {
    for (std::int64_t offset = -3; offset <= 3; ++offset) values.push_back(power + offset);
  }
  for (int i = 0; i < 20000; ++i) {
    values.push_back(static_cast<std::int64_t>(random() >> (2 + random() % 61)) + 1);
  }
  for (const std::int64_t value : values) {
    for (std::uint64_t figures = 0; figures <= 6; ++figures) {
      ASSERT_EQ(roundScalar(value, options({}, figures)), significant(value, figures)) << value;
      ASSERT_EQ(roundScalar(-value, options({}, figures)), significant(-value, figures)) << value;
    }
  }
}

TEST(Distribution, SummarisesInOnePass) {
  const struct {
    std::vector<double> samples;
    const char* expected;
  } rows[] = {{{}, "0 0 0 0 0 "},
              {{5}, "5 5 5 0 1 "},
              {{1, 2, 3, 4}, "1 4 2.5 5 4 "},
              {{-1, -3}, "-3 -1 -2 2 2 "},
              {{2, kNaN}, "2 2 nan nan 2 "},  // not-a-number compares with nothing
              {{kInfinity, 1}, "1 inf nan nan 2 "}};
  for (const auto& row : rows) {
    Distribution distribution;
    distribution.add(row.samples);
    const auto statistics = distribution.statistics();
    std::string text;
    for (const auto& value : statistics) text += description(value) + " ";
    EXPECT_EQ(text, row.expected);
    EXPECT_EQ(statistics[4].as<Number>()->type(), Number::Type::int32);
    EXPECT_EQ(statistics[0].as<Number>()->type(), Number::Type::float64);
  }
}

std::vector<double> doubles(const plist::Array& statistics) {
  std::vector<double> values;
  for (const auto& value : statistics) values.push_back(value.as<Number>()->doubleValue());
  return values;
}

// The operations, one after the other, as they are defined.
std::vector<double> reference(const std::vector<double>& samples) {
  double minimum = samples[0], maximum = minimum, mean = minimum, sum = 0;
  int count = 1;
  for (std::size_t i = 1; i < samples.size(); ++i) {
    const double x = samples[i];
    if (x < minimum)
      minimum = x;
    else if (x > maximum)
      maximum = x;
    count += 1;
    const double delta = x - mean;
    mean = mean + delta / count;
    sum = sum + delta * (x - mean);
  }
  return {minimum, maximum, mean, sum, static_cast<double>(count)};
}

TEST(Distribution, GivesTheSameBitsHoweverTheSamplesAreCut) {
  std::mt19937_64 random(7);
  std::lognormal_distribution<double> spread(3, 4);
  std::vector<double> samples(2000);
  for (double& sample : samples) sample = spread(random) - 50;
  const Intervals intervals({Number(-1.5), Number(std::int64_t{10}), Number(std::int64_t{100})});
  std::vector<std::uint64_t> counts(4);
  for (const double x : samples) ++counts[determineHistBucketForValue(x, intervals)];
  for (const std::size_t cut : {std::size_t{1}, std::size_t{7}, std::size_t{512}, samples.size()}) {
    Distribution plain, counted(&intervals);
    for (std::size_t start = 0; start < samples.size(); start += cut) {
      const auto block =
          std::span<const double>(samples).subspan(start, std::min(cut, samples.size() - start));
      plain.add(block);
      counted.add(block);
    }
    EXPECT_EQ(doubles(plain.statistics()), reference(samples));
    EXPECT_EQ(doubles(counted.statistics()), reference(samples));
    EXPECT_EQ(counted.histogram(), histogramDictForIntervals(intervals, counts));
  }
}

TEST(Histogram, FindsTheFirstBoundThatClosesTheValue) {
  const std::vector<std::vector<Number>> boundsOf = {
      {},
      {Number(std::int64_t{10})},
      {Number(std::int64_t{10}), Number(std::int64_t{100})},
      {Number(-kInfinity), Number(0.5), Number(0.5), Number(kInfinity)},
      {Number(std::int64_t{100}), Number(std::int64_t{10})},  // descending: the order stands
      {Number(1.0), Number(kNaN), Number(3.0)},
      {Number(kNaN)}};
  const double values[] = {-kInfinity, -1, 0, 0.5, 9.9, 10, 10.5, 100, 101, kInfinity, kNaN};
  for (const auto& bounds : boundsOf) {
    const Intervals intervals(bounds);
    for (const double value : values) {
      std::size_t expected = 0;
      while (expected < bounds.size() && !(bounds[expected].doubleValue() >= value)) ++expected;
      EXPECT_EQ(determineHistBucketForValue(value, intervals), expected);
      // The counting path must agree with the search.
      Distribution distribution(&intervals);
      distribution.add(std::vector<double>{value});
      std::vector<std::uint64_t> counts(bounds.size() + 1);
      counts[expected] = 1;
      EXPECT_EQ(distribution.histogram(), histogramDictForIntervals(intervals, counts));
    }
  }
}

TEST(Histogram, LabelsBucketsWithTheirBounds) {
  const Intervals intervals({Number(std::int64_t{10}), Number(100.0), Number(0.1 + 0.2),
                             Number(1e21), Number(std::uint64_t{1} << 63)});
  const std::uint64_t counts[] = {1, 2, 3, 4, 5, ~std::uint64_t{0}};
  const auto histogram = histogramDictForIntervals(intervals, counts);
  ASSERT_TRUE(histogram);
  const plist::Dictionary expected{{"(-inf, 10]", 1},
                                   {"(10, 100]", 2},
                                   {"(100, 0.3]", 3},
                                   {"(0.3, 1e+21]", 4},
                                   {"(1e+21, 9223372036854775808]", 5},
                                   {"(9223372036854775808, inf)", ~std::uint64_t{0}}};
  EXPECT_EQ(description(*histogram), description(expected)) << "the order counts";
  for (const auto& [label, count] : *histogram) {
    EXPECT_EQ(count.as<Number>()->type(), Number::Type::uint64) << label;
  }
  EXPECT_FALSE(histogramDictForIntervals(intervals, std::vector<std::uint64_t>(6)));
}

}  // namespace
}  // namespace report
