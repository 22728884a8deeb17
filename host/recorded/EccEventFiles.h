// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The memory errors that a recorded device's kernel has to tell: the files of device/ecc-events/,
// in bytewise order of their names.
#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <optional>
#include <set>
#include <span>
#include <string>

#include "base/Result.h"
#include "host/files/DeviceRoot.h"
#include "host/files/Pending.h"
#include "platform/Kernel.h"
#include "platform/SystemLog.h"

namespace host::recorded {

class EccEventFiles {
 public:
  EccEventFiles(const DeviceRoot& root, platform::SystemLog& log) : root_(root), log_(log) {}

  // Delivers the next event and removes its file, or has it wait while events are held; none when
  // there is no event. One that the buffer has no room for stays, and fails with ENOMEM. One that
  // is longer than an event is said and moved to the folder rejected/ there.
  std::optional<platform::Kernel::ReadResult> next(std::span<std::byte> buffer);

  // From now on a file that is delivered waits in the folder under a name that no event has, until
  // it is settled: it must not be gone before what was made of it is on disk. `day` is the one that
  // the run is for, if it is for one.
  void hold(std::optional<std::int32_t> day) { run_.begin(day); }

  // Deals with the files that wait, those of an earlier process included: where `done` says so of
  // the day that their run was for they are removed, else they are events again. Events are held no
  // longer. The error is of the folder's path.
  using Done = std::function<bool(const std::optional<std::int32_t>& day)>;
  base::Result<void> settle(const Done& done);

 private:
  base::Result<void> take(int folder, const std::string& name) const;

  const DeviceRoot& root_;
  platform::SystemLog& log_;
  PendingRun run_;              // for which events wait
  std::set<std::string> said_;  // the files of events that were complained of
};

}  // namespace host::recorded
