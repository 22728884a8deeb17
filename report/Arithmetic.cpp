// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "report/Arithmetic.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <limits>
#include <new>
#include <string>

#include "base/Convert.h"

namespace report {

namespace {

std::uint64_t magnitude(std::int64_t value) {
  const auto bits = static_cast<std::uint64_t>(value);
  return value < 0 ? std::uint64_t{0} - bits : bits;
}

// Unsigned arithmetic throughout; what doesn't fit wraps.
std::int64_t roundToBucket(std::int64_t value, std::uint64_t interval) {
  if (interval == 0) return 0;
  if (value >= 0) {
    const std::uint64_t sum = static_cast<std::uint64_t>(value) + interval / 2;
    return static_cast<std::int64_t>(sum / interval * interval);
  }
  // Below zero a half goes toward zero, which is upward.
  const std::uint64_t sum = magnitude(value) + (interval - 1) / 2;
  return static_cast<std::int64_t>(std::uint64_t{0} - sum / interval * interval);
}

// 10^0 to 10^22, which doubles hold exactly.
constexpr std::array<double, 23> kPowersOfTen = {1e0,  1e1,  1e2,  1e3,  1e4,  1e5,  1e6,  1e7,
                                                 1e8,  1e9,  1e10, 1e11, 1e12, 1e13, 1e14, 1e15,
                                                 1e16, 1e17, 1e18, 1e19, 1e20, 1e21, 1e22};

// ceil(log10(number)), for a number above 0. Up to 10^14 the logarithm is never off by so much that
// counting the powers below the number gives another answer, and counting is cheaper.
std::uint64_t digitsOf(double number) {
  if (number > 1e14) return base::saturatingCast<std::uint64_t>(std::ceil(std::log10(number)));
  std::uint64_t digits = 0;
  while (kPowersOfTen[digits] < number) ++digits;
  return digits;
}

double powerOfTen(std::int64_t exponent) {
  const auto index = static_cast<std::size_t>(exponent);
  return index < kPowersOfTen.size() ? kPowersOfTen[index]
                                     : std::pow(10.0, static_cast<double>(exponent));
}

std::int64_t roundToSignificantFigures(std::int64_t value, std::uint64_t figures) {
  if (value == 0) return 0;
  const auto excess =
      static_cast<std::int64_t>(digitsOf(static_cast<double>(magnitude(value))) - figures);
  if (excess < 1) return value;
  const double power = powerOfTen(excess);
  const double rounded = std::round(static_cast<double>(value) / power);
  return base::saturatingCast<std::int64_t>(power * rounded);
}

std::string bucketLabel(const Intervals& intervals, std::size_t bucket) {
  const bool last = bucket == intervals.size();
  std::string label = "(";
  label += bucket == 0 ? "-inf" : intervals[bucket - 1].text();
  label += ", ";
  label += last ? "inf" : intervals[bucket].text();
  label += last ? ")" : "]";
  return label;
}

// Counts instead of searching: no branch depends on the sample, so the count runs beside the
// division of the mean. The bounds ascend.
std::size_t bucketAmongAscending(double value, const double* bounds, std::size_t size) {
  std::size_t below = 0;
  for (std::size_t i = 0; i < size; ++i) below += bounds[i] >= value ? 0 : 1;
  return below;
}

}  // namespace

std::int64_t roundScalar(std::int64_t value, const CounterOptions& options) {
  if (options.bucketInterval) value = roundToBucket(value, *options.bucketInterval);
  if (options.significantFigures) {
    value = roundToSignificantFigures(value, *options.significantFigures);
  }
  return value;
}

std::uint32_t determineHistBucketForValue(double value, const Intervals& intervals) {
  const auto& bounds = intervals.values();
  const auto found =
      std::find_if(bounds.begin(), bounds.end(), [&](double bound) { return bound >= value; });
  return static_cast<std::uint32_t>(found - bounds.begin());
}

std::optional<plist::Dictionary> histogramDictForIntervals(const Intervals& intervals,
                                                           std::span<const std::uint64_t> counts) {
  std::optional<plist::Dictionary> histogram;
  for (std::size_t bucket = 0; bucket < counts.size(); ++bucket) {
    if (counts[bucket] == 0) continue;
    if (!histogram) histogram.emplace();
    histogram->set(bucketLabel(intervals, bucket), counts[bucket]);
  }
  return histogram;
}

Distribution::Distribution(const Intervals* intervals) : intervals_(intervals) {
  if (intervals != nullptr) {
    counts_.reset(new (std::nothrow) std::uint64_t[intervals->size() + 1]());
  }
}

template <typename CountBucket>
void Distribution::addAll(std::span<const double> values, CountBucket countBucket) {
  std::size_t next = 0;
  if (count_ == 0) {
    minimum_ = maximum_ = mean_ = values[0];
    countBucket(values[0]);
    count_ = 1;
    next = 1;
  }
  double minimum = minimum_, maximum = maximum_, mean = mean_, squares = squares_;
  std::int64_t count = count_;
  for (; next < values.size(); ++next) {
    const double x = values[next];
    if (x < minimum) {
      minimum = x;
    } else if (x > maximum) {
      maximum = x;
    }
    countBucket(x);
    ++count;
    const double delta = x - mean;
    mean += delta / static_cast<double>(count);
    squares += delta * (x - mean);
  }
  minimum_ = minimum;
  maximum_ = maximum;
  mean_ = mean;
  squares_ = squares;
  count_ = count;
}

void Distribution::add(std::span<const double> values) {
  if (values.empty()) return;
  if (counts_ == nullptr) {
    addAll(values, [](double) {});
  } else if (intervals_->ascending()) {
    addAll(values, [counts = counts_.get(), bounds = intervals_->values().data(),
                    size = intervals_->size()](double x) {
      ++counts[bucketAmongAscending(x, bounds, size)];
    });
  } else {
    addAll(values, [this](double x) { ++counts_[determineHistBucketForValue(x, *intervals_)]; });
  }
}

plist::Array Distribution::statistics() const {
  const auto count = static_cast<std::int32_t>(
      std::min<std::int64_t>(count_, std::numeric_limits<std::int32_t>::max()));
  plist::Array array;
  array.reserve(5);
  for (const double value : {minimum_, maximum_, mean_, squares_}) array.emplace_back(value);
  array.emplace_back(count);
  return array;
}

std::optional<plist::Dictionary> Distribution::histogram() const {
  if (counts_ == nullptr) return std::nullopt;
  return histogramDictForIntervals(*intervals_, {counts_.get(), intervals_->size() + 1});
}

}  // namespace report
