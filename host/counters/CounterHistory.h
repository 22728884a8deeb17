// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The history of the counters: reads the counters database by day.
#pragma once

#include "host/counters/CounterDatabase.h"
#include "platform/PLHistory.h"

namespace host {

// One record of a packed series: the value (double) and the second within the day (int32), both
// little-endian.
inline constexpr std::size_t kPackedSampleSize = 12;

class CounterHistory : public platform::PLHistory {
 public:
  // The place is borrowed.
  explicit CounterHistory(const CounterPlace& place)
      : database_(place, DeviceRoot::Links::followed) {}

  // Each query sees the database as it was when the query began. A handler may query this history
  // and write to the store.
  //
  // A stored key that can't be written, which this store doesn't make, comes as it is written, in
  // the place of what is stored. Rows whose keys become the same each come: the last counts.
  base::Result<void> scalarsForKeyPrefix(std::string_view keyPrefix, std::int32_t minDaysSince1970,
                                         std::int32_t maxDaysSince1970,
                                         const ScalarRowHandler& rowHandler) override;
  base::Result<void> distributionsForKeyPrefix(std::string_view keyPrefix,
                                               std::int32_t minDaysSince1970,
                                               std::int32_t maxDaysSince1970,
                                               const DistributionRowHandler& rowHandler) override;

 private:
  CounterDatabase database_;
};

}  // namespace host
