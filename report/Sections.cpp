// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "report/Sections.h"

#include <utility>

#include "report/Arithmetic.h"

namespace report {

using platform::LogLevel;

void Sections::noteOptions(std::string_view key, const CounterOptions& options) {
  if (&options == &PLConfig::kUnnamed) unnamed_.emplace(key);
}

void Sections::noteHistogram(std::string_view key, const CounterOptions& options) const {
  if (!options.intervals) return;
  log_->log(LogLevel::debug, "Treating key %.*s as a histogram", static_cast<int>(key.size()),
            key.data());
}

const CounterOptions* Sections::scalarOptions(std::string_view key) const {
  return whitelist_ != nullptr ? whitelist_->configOptionsForScalarKey(key) : nullptr;
}

std::int64_t Sections::addScalar(std::int64_t value, std::string_view key,
                                 const CounterOptions& options) {
  noteOptions(key, options);
  const std::int64_t rounded = roundScalar(value, options);
  scalars.set(key, rounded);
  return rounded;
}

void Sections::addScalarForKey(std::string_view key,
                               const std::function<std::int64_t()>& byExecutingBlock) {
  if (const auto* options = scalarOptions(key)) addScalar(byExecutingBlock(), key, *options);
}

void Sections::computeAndAddDistribution(platform::PLHistoryDistributionEnumerator& samples,
                                         std::string_view key, const CounterOptions& options) {
  noteOptions(key, options);
  noteHistogram(key, options);
  const Intervals* intervals = options.intervals ? &*options.intervals : nullptr;
  Distribution distribution(intervals);
  if (distribution.histogramFailed()) {
    log_->log(LogLevel::standard,
              "Couldn't allocate histCounts for key %.*s. Will not calculate histogram values",
              static_cast<int>(key.size()), key.data());
  }
  auto block = samples.getNextValues();
  for (; block && !block->values.empty(); block = samples.getNextValues()) {
    distribution.add(block->values);
  }
  if (!block) return;
  if (intervals != nullptr && !distribution.histogramFailed()) {
    if (auto histogram = distribution.histogram()) {
      histograms.set(key, std::move(*histogram));
    } else {
      histograms.remove(key);
    }
  }
  distributions.set(key, distribution.statistics());
}

void Sections::keepPlace(std::string_view key, const CounterOptions& options) {
  noteHistogram(key, options);
  distributions.set(key, plist::Array());
  if (options.intervals) histograms.set(key, plist::Dictionary());
}

void Sections::dropKeptPlaces() {
  distributions.keepIf([](std::string_view, const plist::Value& statistics) {
    return !statistics.as<plist::Array>()->empty();
  });
  histograms.keepIf([](std::string_view, const plist::Value& histogram) {
    return !histogram.as<plist::Dictionary>()->empty();
  });
}

}  // namespace report
