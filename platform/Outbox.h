// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What keeps back what a run leaves, until it is known that the run won't be done again.
#pragma once

#include <cstdint>
#include <optional>

namespace platform {

// Logs that are submitted, structured logs and events wait from `hold` to `publish`, and so does
// what is written to the process's own preferences. All three are called with the run lock held.
class Outbox {
 public:
  virtual ~Outbox() = default;

  // What a run left that was ended in the middle: it leaves now if the run was for the recorded day
  // or an earlier one, and is dropped otherwise, for that day will be run again.
  virtual void settle(std::int64_t recordedDay) = 0;

  // A run begins. With a day, publishing is the moment at which that day is recorded.
  virtual void hold(std::optional<std::int32_t> day) = 0;

  // The run is through: the preferences are written, and what waits leaves. Where the record of the
  // run's day, which is among them, can't be written, what waits is dropped, with an error line.
  virtual void publish() = 0;
};

}  // namespace platform
