// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What is this host's of a device's kernel, whoever answers for its values: the ticks are
// nanoseconds of the monotonic clock.
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <span>
#include <string>

#include "platform/Kernel.h"

namespace host {

class HostKernel : public platform::Kernel {
 public:
  std::uint64_t pageSize() override;
  std::uint64_t absoluteTime() override;
  std::optional<Timebase> timebase() override;
  Process process() override;

 protected:
  // What a read comes to. Bytes that the buffer has no room for fail with ENOMEM; a text comes with
  // a closing NUL.
  static ReadResult failed(int error) { return {error, 0}; }
  static ReadResult delivered(std::span<const std::byte> bytes, std::span<std::byte> buffer);
  static ReadResult delivered(const std::string& text, std::span<std::byte> buffer);
};

}  // namespace host
