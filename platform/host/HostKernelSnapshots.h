// Kernel snapshots: device/kernel-snapshot.bin.
#pragma once

#include "platform/KernelSnapshots.h"
#include "platform/host/DeviceRoot.h"

namespace platform::host {

class HostKernelSnapshots : public KernelSnapshots {
 public:
  explicit HostKernelSnapshots(const DeviceRoot& root) : root_(root) {}
  std::optional<std::vector<std::byte>> capture(std::uint32_t flags) override;

 private:
  const DeviceRoot& root_;
};

}  // namespace platform::host
