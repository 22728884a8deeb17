// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/device/HostKernel.h"

#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstddef>
#include <cstdint>
#include <ctime>
#include <optional>
#include <span>
#include <string>

namespace host {

std::uint64_t HostKernel::pageSize() { return static_cast<std::uint64_t>(::sysconf(_SC_PAGESIZE)); }

std::uint64_t HostKernel::absoluteTime() {
  timespec time{};
  ::clock_gettime(CLOCK_MONOTONIC, &time);
  return static_cast<std::uint64_t>(time.tv_sec) * 1'000'000'000 +
         static_cast<std::uint64_t>(time.tv_nsec);
}

std::optional<platform::Kernel::Timebase> HostKernel::timebase() { return Timebase{1, 1}; }

platform::Kernel::Process HostKernel::process() {
  return {program_invocation_short_name, ::getpid()};
}

platform::Kernel::ReadResult HostKernel::delivered(std::span<const std::byte> bytes,
                                                   std::span<std::byte> buffer) {
  if (bytes.size() > buffer.size()) return failed(ENOMEM);
  std::ranges::copy(bytes, buffer.begin());
  return {0, bytes.size()};
}

platform::Kernel::ReadResult HostKernel::delivered(const std::string& text,
                                                   std::span<std::byte> buffer) {
  return delivered(std::as_bytes(std::span(text.c_str(), text.size() + 1)), buffer);
}

}  // namespace host
