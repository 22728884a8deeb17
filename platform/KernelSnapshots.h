// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Snapshots of the kernel's threads.
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <vector>

namespace platform {

class KernelSnapshots {
 public:
  static constexpr std::uint32_t kChunkedData = 0x10000;  // flag: output in chunked-data format

  virtual ~KernelSnapshots() = default;

  // Captures a stack snapshot; none when the configuration is refused or the capture fails.
  virtual std::optional<std::vector<std::byte>> capture(std::uint32_t flags) = 0;
};

}  // namespace platform
