// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Values that the kernel holds under names, its clock, and this process as it knows it.
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <span>
#include <string>
#include <string_view>

namespace platform {

class Kernel {
 public:
  struct ReadResult {
    int error;           // 0, or the error number
    std::size_t length;  // bytes delivered; 0 on an error
  };
  struct Timebase {
    std::uint32_t numerator, denominator;
  };
  struct Process {
    std::string name;
    std::int32_t identifier;
  };

  virtual ~Kernel() = default;

  // Reads a named value into the buffer; what the value doesn't fill stays as it was.
  virtual ReadResult sysctlbyname(std::string_view name, std::span<std::byte> buffer) = 0;

  virtual std::uint64_t pageSize() = 0;  // bytes

  // Ticks since boot, and nanoseconds for each tick as a ratio (none when it can't be read).
  virtual std::uint64_t absoluteTime() = 0;
  virtual std::optional<Timebase> timebase() = 0;

  // The calling process, under the name of its program.
  virtual Process process() = 0;
};

}  // namespace platform
