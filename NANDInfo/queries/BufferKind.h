// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What a captured buffer is, as far as its bytes tell.
#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <string>

namespace NANDInfo {

enum class BufferKind : std::uint8_t {
  text,
  propertyList,
  snapshot,  // of the kernel
  FTLStatistics,
  MSPStatistics,
  defects,
  validity,
  telemetry,  // which can't be told from any other bytes, nor can what follows
  counters,
};

// Why the bytes can't be a buffer of the wanted kind: they are too few, or surely one of another
// kind. The empty text when they may be one.
std::string whyNot(BufferKind wanted, std::span<const std::byte> bytes);

}  // namespace NANDInfo
