// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/StructuredLogs.h"

#include "NANDInfo/NANDLogWriter.h"
#include "NANDInfo/Utilities.h"
#include "NANDInfo/collect/BasicInfo.h"
#include "NANDInfo/collect/LegacyInfo.h"
#include "NANDInfo/deliver/NANDLogWriter.h"
#include "NANDInfo/deliver/StructuredLogs.h"

namespace NANDInfo {

bool gForceCollectionSet = false;

bool DumpStorageStructuredLog(const Services& services, bool flag) {
  return dumpStructuredLogs(services, flag, gForceCollectionSet);
}

void DumpNANDInfo(const Services& services, plist::Dictionary& dictionary) {
  const auto statistics = readLegacyStatistics(services);
  if (statistics) addEntries(legacyInfo(*statistics, std::nullopt), dictionary);
}

void NLW_WriteLog(const Services& services, std::string_view logType,
                  const plist::Dictionary* values) {
  writeNANDLog(services, logType, values);
}

std::string GetFaultwatchKey(const Services& services) {
  return faultwatchKey(services.deviceProperties);
}

int GetCurrentMonthNumber(const Services& services) { return currentDate(services.clock).month; }

std::int64_t GetCurrentYear(const Services& services) { return currentDate(services.clock).year; }

}  // namespace NANDInfo
