// Reads kernel snapshots in chunked-data format: items with a 16-byte header (type, payload size,
// flags), nested in containers.
#pragma once

#include <cstddef>
#include <optional>
#include <span>
#include <string_view>

namespace NANDInfo {

// The I/O statistics of the first thread with the name, in the snapshot's first container and those
// inside it: empty when the thread has none, no value when no such thread is found. Only as much of
// the name is compared as the thread's own item has room for. A snapshot that is cut ends there,
// with what its open containers hold so far. The payload is borrowed from the snapshot.
std::optional<std::span<const std::byte>> getIOStatsWithThreadnameFromKCData(
    std::span<const std::byte> snapshot, std::string_view threadName);

}  // namespace NANDInfo
