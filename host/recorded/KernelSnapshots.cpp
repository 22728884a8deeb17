// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/recorded/KernelSnapshots.h"

#include <cstddef>
#include <cstdint>
#include <optional>
#include <vector>

namespace host::recorded {

std::optional<std::vector<std::byte>> KernelSnapshots::capture(std::uint32_t flags) {
  if ((flags & kChunkedData) == 0) return std::nullopt;
  const auto bytes = root_.readFile("device/kernel-snapshot.bin", kMaxSnapshot + 1);
  if (!bytes || bytes->size() > kMaxSnapshot) return std::nullopt;
  const auto* first = reinterpret_cast<const std::byte*>(bytes->data());
  return std::vector<std::byte>(first, first + bytes->size());
}

}  // namespace host::recorded
