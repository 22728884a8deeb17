// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What a sample device counts, day by day.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "host/counters/CounterStore.h"
#include "tools/mkdevice/Sample.h"

namespace mkdevice {

// The key of the n-th counter that a larger scale makes of a row; the first has the row's own key.
std::string scaledKey(const char* key, int copy);

class SampleCounters {
 public:
  explicit SampleCounters(const Sample& sample);

  // What was recorded on a day: every scalar, then the samples of every distribution in the order
  // of their seconds. The keys are borrowed from this object.
  std::vector<host::CounterChange> ofDay(std::int32_t day) const;

 private:
  Sample sample_;
  std::vector<std::string> scalars_, distributions_;  // `scale` keys for each row of the tables
};

}  // namespace mkdevice
