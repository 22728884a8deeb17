// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Captured buffers as dictionaries.
//
// Each has "ok", whether the bytes are a buffer of its kind and could be read, and "error", the
// library's message or why they are none. What was read stands between them: "fields" is an array
// of [name, value] in the buffer's order.
#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <string_view>

#include "NANDInfo/CounterRecords.h"
#include "plist/Value.h"

namespace NANDInfo {

using Bytes = std::span<const std::byte>;

// "fields".
plist::Dictionary decodedFTL(Bytes bytes);
plist::Dictionary decodedFTLStat(Bytes bytes);
plist::Dictionary decodedLegacy(Bytes bytes);
plist::Dictionary decodedMSP(Bytes bytes);

// "fields": the values of each list, an array.
plist::Dictionary decodedValidity(Bytes bytes);

// "Factory Count", and "defects", a dictionary for each, whose "Reason" is without what its "Mode"
// adds when it is logged.
plist::Dictionary decodedDefects(Bytes bytes);

// "fields": what the swap-out thread has written, and its counters; none when it isn't in the
// snapshot. "items": a dictionary for each type, with how many there are and their bytes.
plist::Dictionary decodedSnapshot(Bytes bytes);

// A vendor's layout of the counter block.
struct CounterLayout {
  const char* name;
  std::size_t words;  // the highest that it reads, and one
  const char* chip;   // the identifier of the chips that have it; empty if the vendor decides
  void (*parse)(CounterBlock block, NandCountersRecord& record);
};
std::span<const CounterLayout> counterLayouts();
const CounterLayout* findCounterLayout(std::string_view name);

// "channels": a dictionary for each, under its index: the summary and the counters. `channels` is
// how many the controller has; 0: as many as fill the bytes.
plist::Dictionary decodedTelemetry(Bytes bytes, const CounterLayout& layout,
                                   std::uint32_t channels);

// The bytes of a channel in a telemetry list.
inline constexpr std::size_t kChannelSize = 4096 + 32;

}  // namespace NANDInfo
