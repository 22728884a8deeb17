// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Kernel snapshots: device/kernel-snapshot.bin.
#pragma once

#include "host/files/DeviceRoot.h"
#include "platform/KernelSnapshots.h"

namespace host::recorded {

inline constexpr std::size_t kMaxSnapshot = std::size_t{64} << 20;

class KernelSnapshots : public platform::KernelSnapshots {
 public:
  explicit KernelSnapshots(const DeviceRoot& root) : root_(root) {}

  // The file's bytes. The capture fails without the file, without the chunked-data flag, in which
  // format the file is, and when the file is longer than a snapshot gets.
  std::optional<std::vector<std::byte>> capture(std::uint32_t flags) override;

 private:
  const DeviceRoot& root_;
};

}  // namespace host::recorded
