// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Validity lists: what is kept came from records that lie within the buffer, and goes into one log.
#include <cstdint>
#include <cstring>
#include <span>

#include "Input.h"
#include "NANDInfo/ValidityList.h"
#include "NANDInfo/deliver/ListHandlers.h"
#include "platform/testing/FakePlatform.h"

using fuzz::require;

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size) {
  const auto buffer = std::as_bytes(std::span(bytes, size));
  const auto lists = NANDInfo::parseValidityList(buffer);
  if (!lists) return 0;
  std::size_t values = 0, filled = 0;
  for (const auto& list : *lists) {
    values += list.size();
    filled += list.empty() ? 0 : 1;
  }
  std::uint32_t claimed;
  std::memcpy(&claimed, bytes, sizeof claimed);
  require(claimed > 0 && claimed <= size / 20 && values <= claimed, "records lie in the buffer");

  platform::fakes::FakePlatform platform(platform::LogLevel::error);
  for (const bool needed : {false, true}) {
    const NANDInfo::StructuredLogState state{.gNeedValidityList = needed};
    require(bool(NANDInfo::DumpValidityList(platform.platform, state, buffer)), "it is dumped");
    require(platform.submission.logs.size() == (needed ? 1 : 0), "once, where it is needed");
  }
  const std::string& log = platform.submission.logs[0].contents;
  std::size_t named = 0;
  for (auto at = log.find("ValidityList["); at != log.npos;
       at = log.find("ValidityList[", at + 1)) {
    ++named;
  }
  require(named == filled, "each list that has values is in it");
  return 0;
}
