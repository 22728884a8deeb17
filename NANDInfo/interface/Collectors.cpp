// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The collectors under the names of the library's interface.

#include "NANDInfo/Collectors.h"

#include "NANDInfo/Magazine.h"
#include "NANDInfo/NANDInfo.h"
#include "NANDInfo/collect/BasicInfo.h"
#include "NANDInfo/collect/DeviceFields.h"
#include "NANDInfo/collect/DiskInfo.h"
#include "NANDInfo/collect/FTLInfo.h"
#include "NANDInfo/collect/FTLStatistics.h"
#include "NANDInfo/collect/HealthInfo.h"
#include "NANDInfo/collect/LegacyInfo.h"
#include "NANDInfo/collect/MSPInfo.h"
#include "NANDInfo/collect/MagazineInfo.h"
#include "NANDInfo/collect/Recorded.h"
#include "NANDInfo/collect/StorageStats.h"
#include "NANDInfo/collect/VMFreezer.h"
#include "platform/SystemLog.h"

namespace NANDInfo {

using plist::Dictionary;

std::optional<Dictionary> gatherZMCFTLData(const Services& services, FTLParser parser,
                                           FTLSource source, std::uint32_t argument) {
  return recorded(readFTLStatistics(services, parser, source, argument));
}

Dictionary gatherZMCFTLOtherData(const Services& services, const Dictionary* ftl) {
  return otherFields(services, ftl);
}

Dictionary gatherZMCOtherData(const Services& services) { return fieldsAlong(services); }

Dictionary buildLegacyNANDInfoDict(const Services& services, const LegacyNandInfoCxt& context,
                                   bool leavesOutVersions) {
  return legacyInfo(context, leavesOutVersions
                                 ? std::nullopt
                                 : std::optional(storeDemoMode(services.preferences)));
}

Dictionary getSpacereapInfo(const Services& services) {
  return purgeableSpace(services.purgeableSpace);
}

Dictionary gatherNANDHealthInfo(const Services& services) { return healthInfo(services); }

std::int32_t storeDemoMode(const Services& services) { return storeDemoMode(services.preferences); }

std::optional<Dictionary> CopyNANDInfo(const Services& services) { return basicInfo(services); }

std::optional<Dictionary> CopyNANDInfoWithOptions(const Services& services, const Dictionary*) {
  if (NandInfoShouldLogAllToEV(services)) return Dictionary();
  services.log.log(platform::LogLevel::standard,
                   "NANDInfo: CopyNANDInfoWithOptions: obtaining FTL data for PRND\n");
  Dictionary info = basicInfo(services);
  services.log.log(platform::LogLevel::standard,
                   "NANDInfo: CopyNANDInfoWithOptions: returning PRND dictionary\n");
  return info;
}

bool NandInfoShouldLogAllToEV(const Services& services) {
  return belongsToSink(services.kernel, services.clock);
}

std::optional<Dictionary> CopyWhitelistedNANDFTLInfo(const Services& services, bool round) {
  return whitelistedFTLInfo(services, round);
}

std::optional<Dictionary> CopyNANDFTLInfo(const Services& services, bool statKeys, bool enabled) {
  if (!enabled) return std::nullopt;
  return wholeFTLInfo(services, statKeys);
}

std::optional<Dictionary> CopyWhitelistedNANDFTLCountersInfo() { return std::nullopt; }

Dictionary CopyWhitelistedNANDMSPInfo(const Services& services, bool round) {
  return whitelistedMSPInfo(services, round);
}

Dictionary CopyWhitelistedStorageStats(const Services& services, bool round) {
  return storageStats(services, round);
}

Dictionary GetDiskInfo(const Services& services) {
  return diskInfo(services.files, services.deviceProperties);
}

Dictionary CopyVMFreezerNANDInfo(const Services& services) {
  return swapOutInfo(services.snapshots);
}

Dictionary CopyServitaNANDInfo(const Services& services) { return servitaInfo(services); }

Dictionary CopyInternalLabNANDInfo(const Services& services) { return internalLabInfo(services); }

Dictionary CopyOTANANDInfo(const Services& services) { return otaInfo(services); }

Dictionary CopySMagNANDFTLInfo(const Services& services, std::uint64_t hours,
                               std::uint32_t deltaFlag, std::uint32_t mode) {
  return magazineInfo(services, hours, deltaFlag != 0, mode);
}

Dictionary CopySMagNANDFTLCustomHistoryInfo(const Services& services, std::uint32_t skips) {
  return magazineHistory(services, skips != 0);
}

}  // namespace NANDInfo
