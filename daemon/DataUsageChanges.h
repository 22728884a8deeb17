// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What each process has sent and received since the day before, from counters that only grow.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "plist/Value.h"

namespace morvend {

// To be added to a counter of today.
struct CounterAddition {
  std::string key;
  std::int64_t value;
  bool operator==(const CounterAddition&) const = default;
};

struct DataUsageChanges {
  std::vector<CounterAddition> additions;  // in the order of the records
  plist::Dictionary baseline;              // for the next day
};

// `records` are the usage service's. The baseline holds, under each process's name, an array of the
// date since which its bytes were counted and the four counts; an entry of another form counts as
// none. `yesterday` is the instant at which that day begins.
//
// A process whose bytes are counted since the same second as in the baseline (a stored date has no
// fractions) has used the differences, in KiB under "datausage.<counter>KB.<process>"; a count that
// went down is "datausage.baddata.<process>". For any other process the counts are its usage if
// they begin yesterday or later, else it is "datausage.olddata.<process>". Less than 1 KiB is
// nothing.
//
// A record without a name or a date is skipped; a count that is not a number is 0.
DataUsageChanges dataUsageChanges(const plist::Dictionary& baseline, const plist::Array& records,
                                  plist::Date yesterday);

}  // namespace morvend
