// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The items of a kernel snapshot in chunked-data format, one after the other.
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <span>

#include "base/ByteReader.h"

namespace NANDInfo {

inline constexpr std::uint32_t kContainerBegin = 0x13, kContainerEnd = 0x14, kIOStatistics = 0x901,
                               kThreadName = 0x909, kEndOfBuffer = 0xF19158ED;

struct SnapshotItem {
  std::uint32_t type;
  std::span<const std::byte> payload;
};

class SnapshotItems {
 public:
  // Borrows the snapshot.
  explicit SnapshotItems(std::span<const std::byte> snapshot) : reader_(snapshot) {}

  // None at the end: that of the buffer, the item that says so, or one that runs over it.
  std::optional<SnapshotItem> next() {
    const auto type = reader_.read<std::uint32_t>();
    const auto size = reader_.read<std::uint32_t>();
    const auto flags = reader_.read<std::uint64_t>();
    whole_ = !type || type == kEndOfBuffer;
    if (!flags || whole_) return std::nullopt;
    const auto payload = reader_.take(*size);
    if (!payload) return std::nullopt;
    return SnapshotItem{*type, *payload};
  }

  // Whether the end that `next` has come to is not that of a cut snapshot.
  bool isWhole() const { return whole_; }

 private:
  base::ByteReader reader_;
  bool whole_ = false;
};

}  // namespace NANDInfo
