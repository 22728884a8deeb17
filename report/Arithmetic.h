// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The arithmetic of the report: rounding of scalars, statistics and histograms of distributions.
// Pure functions; doubles are computed in the order given here on every machine.
#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <span>

#include "plist/Value.h"
#include "report/CounterOptions.h"

namespace report {

// A scalar as its options ask: to the nearest multiple of the bucket interval (halves upward, 0 for
// an interval of 0), then to the significant figures (halves away from zero; a power of ten counts
// one digit fewer than it has).
std::int64_t roundScalar(std::int64_t value, const CounterOptions& options);

// The index of the first bound that is not below the value, or the number of bounds.
std::uint32_t determineHistBucketForValue(double value, const Intervals& intervals);

// The histogram: a label such as "(10, 100]" for each bucket that holds samples, to the number of
// samples (uint64). `counts` has one element more than there are bounds. None when all are zero.
std::optional<plist::Dictionary> histogramDictForIntervals(const Intervals& intervals,
                                                           std::span<const std::uint64_t> counts);

// A day's samples of one key, reduced in one pass by Welford's method.
class Distribution {
 public:
  // With intervals the samples are counted into buckets too; they are borrowed. When the memory for
  // the counters can't be had there is no histogram, and `histogramFailed` says so.
  explicit Distribution(const Intervals* intervals = nullptr);

  bool histogramFailed() const { return intervals_ != nullptr && counts_ == nullptr; }

  // Adds samples, in order.
  void add(std::span<const double> values);

  // [minimum, maximum, mean, sum of squared differences from the mean (doubles), number of samples
  // (int32, saturating)]; zeros without samples.
  plist::Array statistics() const;

  // None without intervals or samples.
  std::optional<plist::Dictionary> histogram() const;

 private:
  template <typename CountBucket>
  void addAll(std::span<const double> values, CountBucket countBucket);

  const Intervals* intervals_;
  std::unique_ptr<std::uint64_t[]> counts_;
  double minimum_ = 0.0, maximum_ = 0.0, mean_ = 0.0, squares_ = 0.0;
  std::int64_t count_ = 0;
};

}  // namespace report
