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
      : log_(place.log), database_(place, DeviceRoot::Links::followed) {}

  // Each query sees the database as it was when the query began. After a failure, which the log
  // tells, this history is empty. A handler may query this history and write to the store.
  //
  // A stored key that can't be written, which this store doesn't make, comes as it is written, in
  // the place of what is stored. Rows whose keys become the same each come: the last counts.
  void scalarsForKeyPrefix(std::string_view keyPrefix, std::int32_t minDaysSince1970,
                           std::int32_t maxDaysSince1970,
                           const ScalarRowHandler& rowHandler) override;
  void distributionsForKeyPrefix(std::string_view keyPrefix, std::int32_t minDaysSince1970,
                                 std::int32_t maxDaysSince1970,
                                 const DistributionRowHandler& rowHandler) override;

  bool failed() const override { return failed_; }

 private:
  void read(const CounterDatabase::Work& work);

  platform::SystemLog& log_;
  CounterDatabase database_;
  bool failed_ = false;
};

}  // namespace host
