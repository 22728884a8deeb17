// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The telemetry list: for each channel of the controller a block of raw counters in its vendor's
// layout (4,096 bytes, all blocks first), and a summary of seven words (32 bytes).
#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "NANDInfo/CounterRecords.h"
#include "base/Exported.h"
#include "base/Result.h"
#include "plist/Value.h"

namespace MORVEND_EXPORTED NANDInfo {

inline constexpr std::size_t kTelemetrySummarySize = 32;

struct TelemetryChannel {
  CounterBlock counters;
  std::span<const std::byte, kTelemetrySummarySize> summary;
};

// The channels, borrowed from the buffer; fails when it is too short for so many. A negative number
// of channels counts as 0.
base::Result<std::vector<TelemetryChannel>> parseTelemetryList(std::span<const std::byte> buffer,
                                                               std::int32_t channels);

enum class ChipKind : std::uint8_t { other, QM7, QM8 };
ChipKind chipKind(std::string_view chipIdentifier);

// The chips' maker, of which the list's reader is told by a "manufacturer-id": its first six bytes
// but the lowest, in the order in which they are read.
struct Vendor {
  std::uint64_t code = 0;
  std::string complaint;  // of characters that aren't hexadecimal, for standard output
};
Vendor vendorOf(std::string_view manufacturerIdentifier);

// The converter of the counter blocks; the vendor (48 bits) tells only on other chips.
using CounterConverter = void(CounterBlock block, NandCountersRecord& record);
CounterConverter* counterConverter(ChipKind chip, std::uint64_t vendor);

// The summary and the counters of one channel, each counter under its name and index.
plist::Dictionary telemetryLog(const TelemetryChannel& channel, ChipKind chip,
                               CounterConverter* convert);

}  // namespace NANDInfo
