// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What Linux has a true equivalent of: the identifier of this boot, the size of the swap space, and
// what has been written to it.
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <span>
#include <string_view>
#include <vector>

#include "host/device/HostKernel.h"
#include "host/files/DeviceRoot.h"
#include "platform/KernelSnapshots.h"

namespace host::machine {

class Kernel final : public HostKernel {
 public:
  explicit Kernel(const DeviceRoot& files) : files_(files) {}

  // "kern.bootsessionuuid" in upper case; the record of "vm.swapusage" with its first field, the
  // total size in bytes, which a caller without room for the record gets alone. Anything else fails
  // with ENOENT.
  ReadResult sysctlbyname(std::string_view name, std::span<std::byte> buffer) override;

 private:
  ReadResult bootSession(std::span<std::byte> buffer);
  ReadResult swapUsage(std::span<std::byte> buffer);

  const DeviceRoot& files_;
};

class KernelSnapshots final : public platform::KernelSnapshots {
 public:
  // Both are borrowed.
  KernelSnapshots(const DeviceRoot& files, platform::Kernel& kernel)
      : files_(files), kernel_(kernel) {}

  // One thread, the swap-out thread, which has written what was swapped out since the machine
  // started. Without that figure the capture fails, and without the chunked-data flag.
  std::optional<std::vector<std::byte>> capture(std::uint32_t flags) override;

 private:
  const DeviceRoot& files_;
  platform::Kernel& kernel_;
};

}  // namespace host::machine
