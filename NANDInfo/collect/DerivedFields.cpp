// The fields that are derived from the FTL statistics, and those that go with them.

#include <algorithm>

#include "NANDInfo/NANDInfo.h"
#include "NANDInfo/Services.h"
#include "NANDInfo/decode/Counters.h"
#include "NANDInfo/decode/Weeks.h"
#include "platform/PreferenceStore.h"
#include "platform/PurgeableSpace.h"

namespace NANDInfo {

using plist::Dictionary;

namespace {

constexpr char kSpacereapError[] = "com.norba.NANDInfo.Spacereap.Error";

void copyIfPresent(const Dictionary& from, std::string_view key, Dictionary& to,
                   std::string_view newKey) {
  if (const auto* value = from.find(key)) CopyDictionary(newKey, *value, to);
}

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

void addFTLFields(const Dictionary& ftl, Dictionary& derived) {
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
}

}  // namespace

std::int32_t storeDemoMode(const Services& services) {
  return services.preferences.QNSPreferencesGetBooleanValue("StoreDemoMode",
                                                            "com.norba.demo-settings")
             ? 1
             : 0;
}

Dictionary getSpacereapInfo(const Services& services) {
  Dictionary info;
  if (!services.purgeableSpace.isPresent()) return info;
  const auto answer = services.purgeableSpace.SpacereapCopyItemizedPurgeableSpaceWithInfo(
      {{"SPACEREAP_VOLUME", "/private/var"}});
  if (!answer) {
    SetAPIErrorMessage(
        "getSpacereapInfo: unable to get output from SpacereapCopyItemizedPurgeableSpaceWithInfo");
    return info;
  }
  if (answer->find(kSpacereapError) != nullptr) return info;
  copyIfPresent(*answer, "SPACEREAP_TOTAL_AVAILABLE", info, kTLM_Spacereap_totalPurgeable);
  copyIfPresent(*answer, "SPACEREAP_NONPURGEABLE_AMOUNT", info, kTLM_Spacereap_totalNonPurgeable);
  return info;
}

Dictionary gatherZMCFTLOtherData(const Services& services, const Dictionary* ftl) {
  Dictionary derived = getSpacereapInfo(services);
  addEntries(CopyVMFreezerNANDInfo(services), derived);
  addEntries(GetDiskInfo(services), derived);
  derived.set(kTLM_storeDemoMode, storeDemoMode(services));
  if (ftl != nullptr) {
    addFTLFields(*ftl, derived);
  } else {
    SetAPIErrorMessage("gatherZMCFTLOtherData: ftlDict is NULL");
  }
  return derived;
}

Dictionary gatherZMCOtherData(const Services& services) {
  Dictionary fields;
  const auto ftl = gatherZMCFTLData(services, FTLParser::named, FTLSource::statistics, 0);
  if (!ftl) {
    SetAPIErrorMessage("gatherZMCOtherData: Unable to get FTL counters");
    return fields;
  }
  const Dictionary derived = gatherZMCFTLOtherData(services, &*ftl);
  for (const auto& [key, digits] : FTLStats4MSPStats()) copyIfPresent(derived, key, fields, key);
  return fields;
}

}  // namespace NANDInfo
