// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Defects lists: as many records as are claimed and fit, and a structured log for each.
#include <algorithm>
#include <cstdint>
#include <cstring>
#include <span>

#include "Input.h"
#include "NANDInfo/DefectsList.h"
#include "NANDInfo/deliver/ListHandlers.h"
#include "platform/testing/FakePlatform.h"

using fuzz::require;

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size) {
  const auto buffer = std::as_bytes(std::span(bytes, size));
  const auto list = NANDInfo::DefectsList::parse(buffer);
  require(static_cast<bool>(list) == (size >= 12), "a list has its header");

  platform::fakes::Journal journal;
  platform::fakes::FakeHousekeeping faultwatch(journal);
  platform::fakes::FakeStreams streams;
  const plist::Dictionary characteristics{{"nand-device-desc", static_cast<std::int64_t>(size)}};
  const char* const driver = size % 2 == 0 ? "ZMCStorage" : "";
  const bool dumped = static_cast<bool>(
      NANDInfo::DumpDefectsList(faultwatch, streams, characteristics, driver, buffer));
  const auto& logs = faultwatch.structured;
  require(dumped == static_cast<bool>(list), "what is a list is logged");
  if (!list) return require(logs.empty(), "what is none isn't"), 0;

  std::uint32_t claimed;
  std::memcpy(&claimed, bytes + 8, sizeof claimed);
  require(list->size() == std::min<std::size_t>(claimed, (size - 12) / 32), "what fits is kept");
  require(logs.size() == list->size() + 1 && logs[0].second.size() == 2, "each has its log");
  std::size_t unknown = 0;
  for (std::size_t i = 0; i < list->size(); ++i) {
    const auto log = NANDInfo::defectLog((*list)[i]);
    unknown += NANDInfo::reasonOffset((*list)[i].mode) ? 0 : 1;
    require(log.size() == 8 && logs[i + 1].second.size() == 8, "of eight figures");
    require(*logs[i + 1].second.find("Block") == *log.find("Block"), "in the list's order");
  }
  require(streams.errors.size() == (size % 2 == 0 ? 0 : unknown), "an unknown mode is said");
  return 0;
}
