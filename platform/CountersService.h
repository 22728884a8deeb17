// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The device's counters service, as its clients see it. Values may be recorded from any thread.
#pragma once

#include <cstdint>
#include <span>
#include <string>
#include <string_view>

#include "base/Result.h"
#include "plist/Value.h"

namespace platform {

// A key and its scalar for today; the key is borrowed.
struct ScalarValue {
  std::string_view key;
  std::int64_t value;
};

class CountersService {
 public:
  virtual ~CountersService() = default;

  // Today: whole days since 1970-01-01 on the service's calendar.
  virtual std::int32_t PLDaysSince1970() = 0;

  // The instant at which a day begins: the inverse of PLDaysSince1970.
  virtual plist::Date PLDateFromDaysSince1970(std::int32_t day) = 0;

  // Asks the service to bring everything recorded so far into its database.
  virtual void PLClientCheckpoint() = 0;

  // A key's scalar for today: holds the value, or has it added to what it holds. The service says
  // so in the log when a value can't be recorded.
  virtual void PLClientSetValueForScalarKey(std::string_view key, std::int64_t value) = 0;
  virtual void PLClientAddValueForScalarKey(std::string_view key, std::int64_t value) = 0;

  // The same for several keys, one after the other; a service may record them as one, all or none.
  virtual void PLClientSetValuesForScalarKeys(std::span<const ScalarValue> values) {
    for (const auto& [key, value] : values) PLClientSetValueForScalarKey(key, value);
  }
  virtual void PLClientAddValuesForScalarKeys(std::span<const ScalarValue> values) {
    for (const auto& [key, value] : values) PLClientAddValueForScalarKey(key, value);
  }

  // The same, and keeps a text under a name, for what must not be added again: both, or neither and
  // then false, which the service says in the log. Empty: nothing is kept any more.
  virtual bool addValuesAndKeep(std::span<const ScalarValue> values, std::string_view name,
                                std::string_view text) = 0;

  // What was kept under a name; empty: nothing.
  virtual base::Result<std::string> keptText(std::string_view name) = 0;
};

}  // namespace platform
