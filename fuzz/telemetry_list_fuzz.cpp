// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Telemetry lists: the first six bytes say what the characteristics would, the rest is the list, or
// what the list repeats.
#include <cstdint>
#include <span>
#include <string>

#include "Input.h"
#include "NANDInfo/TelemetryList.h"
#include "NANDInfo/deliver/ListHandlers.h"
#include "platform/testing/FakePlatform.h"

using fuzz::require;

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size) {
  constexpr const char* kVendors[] = {"4582603A57", "458260DE57", "AD82522321", "x"};
  constexpr const char* kChips[] = {"S3E", "QM7", "QM8"};
  constexpr std::size_t kKeys[] = {127, 135, 175};  // by kind of chip
  constexpr std::size_t kMaxList = 4128;            // as much as a channel takes
  if (size < 6) return 0;
  fuzz::Input input(bytes, size);
  const unsigned kind = input.number<std::uint8_t>() % 3, how = input.number<std::uint8_t>();
  const auto channels = static_cast<std::int32_t>(input.number<std::uint32_t>());
  const std::string_view given = fuzz::textOf(input.rest());
  std::string repeated(given);
  for (unsigned left = how >> 2; left > 0 && repeated.size() < kMaxList; --left) repeated += given;
  const auto buffer = std::as_bytes(std::span(repeated));

  const auto list = NANDInfo::parseTelemetryList(buffer, channels);
  const std::size_t expected = channels > 0 ? static_cast<std::size_t>(channels) : 0;
  require(static_cast<bool>(list) == (expected <= buffer.size() / 4128), "channels lie in it");
  platform::fakes::Journal journal;
  platform::fakes::FakeHousekeeping faultwatch(journal);
  platform::fakes::FakeStreams streams;
  const char* const vendor = kVendors[how % 4];
  const plist::Dictionary characteristics{
      {"chip-id", kChips[kind]}, {"manufacturer-id", vendor}, {"num-bus", channels}};
  const bool dumped =
      static_cast<bool>(NANDInfo::DumpTelemetryList(faultwatch, streams, characteristics, buffer));
  const auto& logs = faultwatch.structured;
  require(dumped == static_cast<bool>(list), "what is a list is logged");
  require(logs.size() == (list ? expected : 0), "a log for each channel");
  if (!list) return 0;
  require(list->size() == expected, "there are as many as the device has");
  const auto chip = NANDInfo::chipKind(kChips[kind]);
  auto* convert = NANDInfo::counterConverter(chip, NANDInfo::vendorOf(vendor).code);
  for (const auto& log : logs) require(log.second.size() == kKeys[kind], "of all its counters");
  if (!logs.empty()) {
    require(logs.back().second == NANDInfo::telemetryLog(list->back(), chip, convert),
            "that its vendor's layout has");
  }
  return 0;
}
