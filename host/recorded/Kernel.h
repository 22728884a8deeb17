// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Kernel values: a recorded device's device/kernel.plist and device/ecc-events/, or what this
// machine has a true equivalent of.
#pragma once

#include <set>
#include <string>

#include "host/files/DeviceFile.h"
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
  // "kern.next_ecc_event" delivers the next file of device/ecc-events/ and removes it; one that
  // doesn't fit stays. One that is longer than an event is said and moved to the folder rejected/
  // there.
  ReadResult sysctlbyname(std::string_view name, std::span<std::byte> buffer) override;

  std::uint64_t pageSize() override;
  std::uint64_t absoluteTime() override;
  std::optional<Timebase> timebase() override;
  Process process() override;

 private:
  std::optional<ReadResult> nextEvent(std::span<std::byte> buffer);
  const plist::Value* deviceValue(std::string_view name);

  const DeviceRoot& root_;
  platform::SystemLog& log_;
  DeviceFile values_;
  std::set<std::string> saidEvents_;  // the files of events that were complained of
};

}  // namespace host::recorded
