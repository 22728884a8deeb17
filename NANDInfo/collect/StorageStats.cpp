// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/collect/StorageStats.h"

#include <utility>

#include "NANDInfo/APIErrorMessage.h"
#include "NANDInfo/EAN.h"
#include "NANDInfo/Keys.h"
#include "NANDInfo/Whitelists.h"
#include "NANDInfo/collect/DerivedFields.h"
#include "NANDInfo/collect/FTLInfo.h"
#include "NANDInfo/controller/EANService.h"

namespace NANDInfo {

using plist::Dictionary;

namespace {

constexpr const char* kDerivedFields[] = {kTLM_formatWeeksSince2000, kTLM_DQ_Capacity_GB,
                                          kTLM_averageSLCPECycles,   kTLM_averageTLCPECycles,
                                          kTLM_hostWrites,           kTLM_DQ_Diskfullness_BP};

}  // namespace

Dictionary storageStats(const CollectServices& services, bool round) {
  Dictionary statistics;
  const Dictionary derived = fieldsAlong(services);
  for (const char* key : kDerivedFields) copyIfPresent(derived, key, statistics, key);
  for (const EANQuery& query : EANQueries()) {
    statistics.set(query.key, askEAN(services.controller, query.figure, query.code));
  }
  Dictionary info = CreateFilteredDict_SigDig(std::move(statistics),
                                              &WhitelistedStorageStats_SigDigDict(), round);
  info.set(kTLM_APIErrorMessage, GetAPIErrorMessage());
  return info;
}

}  // namespace NANDInfo
