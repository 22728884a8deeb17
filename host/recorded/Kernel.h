// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Kernel values: device/kernel.plist and device/ecc-events/.
#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <string_view>

#include "host/device/HostKernel.h"
#include "host/files/DeviceFile.h"
#include "host/recorded/EccEventFiles.h"

namespace host::recorded {

class Kernel final : public HostKernel {
 public:
  // `events` is borrowed.
  Kernel(const DeviceRoot& root, platform::SystemLog& log, EccEventFiles& events)
      : values_(root, log, "device/kernel.plist"), events_(events) {}

  // Integers come little-endian in the buffer's width, in 8 bytes when it is larger. Texts come
  // with a closing NUL; a text or data that is longer than the buffer fails with ENOMEM. A name
  // that nothing is known of fails with ENOENT. "kern.next_ecc_event" delivers the events first.
  ReadResult sysctlbyname(std::string_view name, std::span<std::byte> buffer) override;

  // "hw.pagesize", else the host's.
  std::uint64_t pageSize() override;

 private:
  ReadResult deliver(const plist::Value& value, std::span<std::byte> buffer);
  const plist::Value* deviceValue(std::string_view name);

  DeviceFile values_;
  EccEventFiles& events_;
};

}  // namespace host::recorded
