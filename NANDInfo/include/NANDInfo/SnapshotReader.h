// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Reads kernel snapshots in chunked-data format: items with a 16-byte header (type, payload size,
// flags), nested in containers.
#pragma once

#include <cstddef>
#include <optional>
#include <span>
#include <string_view>

#include "base/Exported.h"

namespace MORVEND_EXPORTED NANDInfo {

// The I/O statistics of the first thread with the name, in the snapshot's first container and those
// inside it: empty when the thread has none, no value when no such thread is found or the name is
// null. Only as much of the name is compared as the thread's own item has room for. A snapshot that
// is cut ends there, with what its open containers hold so far; an end-of-buffer item ends the
// container that it stands in. The payload is borrowed from the snapshot.
std::optional<std::span<const std::byte>> getIOStatsWithThreadnameFromKCData(
    std::span<const std::byte> snapshot, std::string_view threadName);

// Where a walk stopped: the offset of the item at which it did, and of the buffer's end.
struct KCDataPosition {
  std::size_t item = 0, end = 0;
};

// The same, and where the search stopped: at the item that closed the first container, or at one
// that couldn't be read.
std::optional<std::span<const std::byte>> getIOStatsWithThreadnameFromKCDataHelper(
    std::span<const std::byte> snapshot, std::string_view threadName, KCDataPosition& stopped);

}  // namespace NANDInfo
