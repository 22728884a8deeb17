// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Kernel snapshots. What is found is the payload of one of the snapshot's statistics items.
#include <cstdint>
#include <cstdlib>

#include "NANDInfo/SnapshotReader.h"
#include "base/ByteReader.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size) {
  const auto snapshot = std::as_bytes(std::span(bytes, size));
  const auto find = [&](std::string_view name) {
    const auto found = NANDInfo::getIOStatsWithThreadnameFromKCData(snapshot, name);
    if (!found || found->empty()) return;
    const auto offset = static_cast<std::size_t>(found->data() - snapshot.data());
    if (offset < 16 || offset > size || found->size() > size - offset) std::abort();
    base::ByteReader header(snapshot.subspan(offset - 16));
    if (header.read<std::uint32_t>() != 0x901u) std::abort();
    if (header.read<std::uint32_t>() != found->size()) std::abort();
  };
  find("VM_swapout");
  find("");
  return 0;
}
