// Reads kernel snapshots in chunked-data format: items with a 16-byte header (type, payload size,
// flags), nested in containers.
#pragma once

#include <cstddef>
#include <optional>
#include <span>
#include <string_view>

namespace NANDInfo {

// The I/O statistics of the first thread with the name: empty when the thread has none, no value
// when no such thread is found. The payload is borrowed from the snapshot.
std::optional<std::span<const std::byte>> getIOStatsWithThreadnameFromKCData(
    std::span<const std::byte> snapshot, std::string_view threadName);

}  // namespace NANDInfo
