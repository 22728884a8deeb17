// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What a report holds of counters and texts, and the way into it.
#pragma once

#include <cstdint>
#include <functional>
#include <set>
#include <string>
#include <string_view>

#include "platform/PLHistory.h"
#include "platform/SystemLog.h"
#include "plist/Value.h"
#include "report/CounterOptions.h"
#include "report/PLConfig.h"

namespace report {

class Sections {
 public:
  // Empty ones. The whitelist may be null, then no key is named; both are borrowed.
  Sections(const PLConfig* whitelist, platform::SystemLog& log)
      : whitelist_(whitelist), log_(&log) {}

  // The options of a scalar's key, or null when it is not to be reported.
  const CounterOptions* scalarOptions(std::string_view key) const;

  // Stores a scalar, rounded as its options ask, and returns what it stored.
  std::int64_t addScalar(std::int64_t value, std::string_view key, const CounterOptions& options);

  // The same for a value that is computed only if its key is whitelisted.
  void addScalarForKey(std::string_view key, const std::function<std::int64_t()>& byExecutingBlock);

  // Stores the statistics of the samples, and their histogram if the options hold intervals. Both
  // take the place of what the key had. Nothing when the samples can't be read.
  void computeAndAddDistribution(platform::PLHistoryDistributionEnumerator& samples,
                                 std::string_view key, const CounterOptions& options);

  // For a distribution of which a later day has a row too, which replaces this one: the key stands
  // where this day's row puts it, without its samples being read.
  void keepPlace(std::string_view key, const CounterOptions& options);
  // The places to which no later row came.
  void dropKeptPlaces();

  void addMetadata(std::string_view key, std::string text) { metadata.set(key, std::move(text)); }

  // Whether no counter has been added; texts don't count.
  bool empty() const { return scalars.empty() && distributions.empty() && histograms.empty(); }

  // How many keys are in them that no whitelist entry names: an internal build's.
  std::size_t unnamedKeys() const { return unnamed_.size(); }

  plist::Dictionary scalars;        // int64
  plist::Dictionary distributions;  // the five statistics
  plist::Dictionary histograms;     // dictionaries of bucket label to count
  plist::Dictionary metadata;       // texts

 private:
  void noteOptions(std::string_view key, const CounterOptions& options);
  void noteHistogram(std::string_view key, const CounterOptions& options) const;

  const PLConfig* whitelist_;
  platform::SystemLog* log_;
  std::set<std::string, std::less<>> unnamed_;
};

}  // namespace report
