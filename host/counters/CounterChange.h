// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What is recorded in the counters database.
#pragma once

#include <cstdint>
#include <string_view>

#include "base/Result.h"
#include "host/counters/SQLite.h"

namespace host {

// One thing to be recorded: a scalar set or added to, or a sample pushed. In the key, what can't be
// written is recorded as U+FFFD.
struct CounterChange {
  enum class Kind { set, add, push };

  Kind kind;
  std::string_view key;
  std::int32_t day;
  std::int64_t amount = 0;   // set, add
  double sample = 0;         // push; not-a-number is refused
  std::int32_t seconds = 0;  // push: the second within the day
};

// Writes a change to an open database of the store. Sums saturate.
base::Result<void> record(sqlite::Connection& connection, const CounterChange& change);

}  // namespace host
