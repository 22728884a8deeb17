// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/collect/VMFreezer.h"

#include <cstddef>
#include <cstdint>
#include <span>

#include "NANDInfo/Keys.h"
#include "NANDInfo/SnapshotReader.h"
#include "base/ByteReader.h"
#include "platform/KernelSnapshots.h"

namespace NANDInfo {

namespace {

constexpr std::size_t kBytesWritten = 3;  // its place among the 64-bit counters

std::uint64_t bytesWritten(std::span<const std::byte> statistics) {
  base::ByteReader reader(statistics);
  if (!reader.take(kBytesWritten * sizeof(std::uint64_t))) return 0;
  return reader.read<std::uint64_t>().value_or(0);
}

}  // namespace

plist::Dictionary swapOutInfo(platform::KernelSnapshots& snapshots) {
  const auto snapshot = snapshots.capture(platform::KernelSnapshots::kChunkedData);
  if (!snapshot) return {};
  const auto statistics = getIOStatsWithThreadnameFromKCData(*snapshot, "VM_swapout");
  if (!statistics) return {};
  const std::uint64_t written = bytesWritten(*statistics);
  return {{kTLM_VMFreezer_bytesWritten, written},
          {kNANDInfoVMFreezerNumPhysicalWritesKey, written}};
}

}  // namespace NANDInfo
