// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Kernel values: a recorded device's device/kernel.plist and device/ecc-events/, or what this
// machine has a true equivalent of.
#pragma once

#include <cstdint>
#include <functional>
#include <optional>
#include <set>
#include <string>

#include "base/Result.h"
#include "host/files/DeviceFile.h"
#include "host/files/Pending.h"
#include "platform/Kernel.h"

namespace host::recorded {

class Kernel : public platform::Kernel {
 public:
  Kernel(const DeviceRoot& root, platform::SystemLog& log)
      : root_(root), log_(log), values_(root, log, "device/kernel.plist") {}

  // Integers come little-endian in the buffer's width, in 8 bytes when it is larger. Texts come
  // with a closing NUL; a text or data that is longer than the buffer fails with ENOMEM. A name
  // that nothing is known of fails with ENOENT.
  //
  // "kern.next_ecc_event" delivers the next file of device/ecc-events/ and removes it, or has it
  // wait while events are held; one that doesn't fit stays. One that is longer than an event is
  // said and moved to the folder rejected/ there.
  ReadResult sysctlbyname(std::string_view name, std::span<std::byte> buffer) override;

  // From now on a file that is delivered waits in the folder under a name that no event has, until
  // it is settled: it must not be gone before what was made of it is on disk. `day` is the one that
  // the run is for, if it is for one.
  void holdEvents(std::optional<std::int32_t> day) { run_.begin(day); }

  // Deals with the files that wait, those of an earlier process included: where `done` says so of
  // the day that their run was for they are removed, else they are events again. Events are held no
  // longer. The error is of the folder's path.
  using Done = std::function<bool(const std::optional<std::int32_t>& day)>;
  base::Result<void> settle(const Done& done);

  std::uint64_t pageSize() override;
  std::uint64_t absoluteTime() override;
  std::optional<Timebase> timebase() override;
  Process process() override;

 private:
  base::Result<void> take(int folder, const std::string& name) const;
  std::optional<ReadResult> nextEvent(std::span<std::byte> buffer);
  const plist::Value* deviceValue(std::string_view name);

  const DeviceRoot& root_;
  platform::SystemLog& log_;
  DeviceFile values_;
  PendingRun run_;                    // for which events wait
  std::set<std::string> saidEvents_;  // the files of events that were complained of
};

}  // namespace host::recorded
