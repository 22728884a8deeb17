// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Telemetry lists: the first six bytes say what the characteristics would, the rest is the list.
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <span>

#include "NANDInfo/TelemetryList.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size) {
  constexpr std::uint64_t kVendors[] = {0x4582603A5700, 0x458260DE5700, 0xAD8252232100, 0};
  constexpr std::size_t kKeys[] = {127, 135, 175};  // by kind of chip
  if (size < 6) return 0;
  const auto chip = static_cast<NANDInfo::ChipKind>(bytes[0] % 3);
  auto* convert = NANDInfo::counterConverter(chip, kVendors[bytes[1] % 4]);
  std::int32_t channels;
  std::memcpy(&channels, bytes + 2, sizeof channels);
  const auto buffer = std::as_bytes(std::span(bytes + 6, size - 6));
  const auto list = NANDInfo::parseTelemetryList(buffer, channels);
  const std::size_t expected = channels > 0 ? static_cast<std::size_t>(channels) : 0;
  if (static_cast<bool>(list) != (expected <= buffer.size() / 4128)) std::abort();
  if (!list) return 0;
  if (list->size() != expected) std::abort();
  for (const auto& channel : *list) {
    const auto log = NANDInfo::telemetryLog(channel, chip, convert);
    if (log.size() != kKeys[bytes[0] % 3]) std::abort();
  }
  return 0;
}
