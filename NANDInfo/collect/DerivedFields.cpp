// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/collect/DerivedFields.h"

#include <algorithm>
#include <cstdint>

#include "NANDInfo/Keys.h"
#include "NANDInfo/Whitelists.h"
#include "NANDInfo/decode/Counters.h"
#include "NANDInfo/decode/Weeks.h"

namespace NANDInfo {

using plist::Dictionary;

namespace {

std::int64_t counter(const Dictionary& ftl, std::string_view array, std::uint64_t index) {
  return signed32(ftl, indexed(array, index)).value_or(0);
}

// The most refreshes of any boot block.
std::int64_t mostRefreshes(const Dictionary& ftl) {
  std::int64_t most = 0;
  for (std::uint64_t i = 0; i < 8; ++i) {
    most = std::max(most, counter(ftl, "numBootBlockRefreshSuccess_", i) +
                              counter(ftl, "numBootBlockRefreshFail_", i));
  }
  return most;
}

// Failures of the boot blocks of each MSP: the first block is the main one, three are its backups.
struct BootBlockFailures {
  const char *counters, *mainKey, *backupKey;
};
constexpr BootBlockFailures kBootBlockFailures[] = {
    {"mspBootBlockReadFails_", kTLM_mspBootBlockReadFails_main, kTLM_mspBootBlockReadFails_backup},
    {"mspBootBlockProgFails_", kTLM_mspBootBlockProgFails_main, kTLM_mspBootBlockProgFails_backup},
    {"mspBootBlockEraseFails_", kTLM_mspBootBlockEraseFails_main,
     kTLM_mspBootBlockEraseFails_backup},
};

void addBootBlockFailures(const Dictionary& ftl, std::uint64_t blocksPerMSP, Dictionary& derived) {
  for (const auto& [counters, mainKey, backupKey] : kBootBlockFailures) {
    std::int64_t main = 0, backup = 0;
    for (std::uint64_t msp = 0; msp < 8; ++msp) {
      const std::uint64_t block = msp * blocksPerMSP;
      main += counter(ftl, counters, block);
      for (std::uint64_t i = 1; i <= 3; ++i) backup += counter(ftl, counters, block + i);
    }
    derived.set(mainKey, main);
    derived.set(backupKey, backup);
  }
}

}  // namespace

Dictionary derivedFields(const Dictionary& ftl) {
  Dictionary derived;
  const auto userStart = signed32(ftl, "userPartitionStart");
  const auto intermediateStart = signed32(ftl, "intermediatePartitionStart");
  if (userStart && intermediateStart) {
    derived.set(kTLM_intermediatePartitionSize,
                static_cast<std::uint64_t>(std::int64_t{*userStart} - *intermediateStart));
  }
  const auto formatTime = static_cast<std::uint32_t>(signed32(ftl, "utilFormatTime").value_or(0));
  derived.set(kTLM_formatWeeksSince2000, weeksSince2000(formatTime));
  copyIfPresent(ftl, "averageSLCPECycles", derived, kTLM_averageSLCPECycles);
  copyIfPresent(ftl, "averageTLCPECycles", derived, kTLM_averageTLCPECycles);
  copyIfPresent(ftl, "hostWrites", derived, kTLM_hostWrites);
  copyIfPresent(ftl, "powerOnHours", derived, kTLM_powerOnHours);
  copyIfPresent(ftl, "powerOnSeconds", derived, kTLM_powerOnSeconds);
  derived.set(kTLM_numBootBlockRefreshes_max, mostRefreshes(ftl));
  if (const auto* blocksPerMSP = ftl.number("mspBootBlockCountPerMsp")) {
    addBootBlockFailures(ftl, blocksPerMSP->uint64Value(), derived);
  }
  return derived;
}

Dictionary sharedFields(const Dictionary& derived) {
  Dictionary fields;
  for (const auto& [key, digits] : FTLStats4MSPStats()) copyIfPresent(derived, key, fields, key);
  return fields;
}

void copyIfPresent(const Dictionary& from, std::string_view key, Dictionary& to,
                   std::string_view newKey) {
  if (const auto* value = from.find(key)) to.set(newKey, *value);
}

}  // namespace NANDInfo
