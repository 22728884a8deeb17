// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// How a whitelisted counter is treated: one entry of the whitelist.
#pragma once

#include <cstdint>
#include <optional>
#include <vector>

#include "plist/Value.h"

namespace report {

// The upper bounds of a histogram's buckets, expected in ascending order.
class Intervals {
 public:
  explicit Intervals(std::vector<plist::Number> bounds);

  std::size_t size() const { return bounds_.size(); }
  const plist::Number& operator[](std::size_t i) const { return bounds_[i]; }

  // The bounds as doubles, and whether they never descend (not-a-number counts as descending).
  const std::vector<double>& values() const { return values_; }
  bool ascending() const { return ascending_; }

 private:
  std::vector<plist::Number> bounds_;
  std::vector<double> values_;
  bool ascending_;
};

// Nothing set: reported as it is, without a histogram.
struct CounterOptions {
  std::optional<std::uint64_t> bucketInterval;      // "bucket_interval", for scalars
  std::optional<std::uint64_t> significantFigures;  // "sig_fig", for scalars
  std::optional<Intervals> intervals;               // "intervals", for distributions
};

// The options that an entry of the whitelist holds; none when one of them has the wrong type or is
// negative. Keys that aren't options are ignored.
std::optional<CounterOptions> parseCounterOptions(const plist::Value& entry);

}  // namespace report
