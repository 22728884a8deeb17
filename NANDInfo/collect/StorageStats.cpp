// The storage statistics: a few derived fields, and the EAN service's images.

#include "NANDInfo/NANDInfo.h"
#include "NANDInfo/Services.h"

namespace NANDInfo {

using plist::Dictionary;

namespace {

constexpr const char* kDerivedFields[] = {kTLM_formatWeeksSince2000, kTLM_DQ_Capacity_GB,
                                          kTLM_averageSLCPECycles,   kTLM_averageTLCPECycles,
                                          kTLM_hostWrites,           kTLM_DQ_Diskfullness_BP};

}  // namespace

Dictionary CopyWhitelistedStorageStats(const Services& services, bool round) {
  Dictionary statistics;
  const Dictionary derived = gatherZMCOtherData(services);
  for (const char* key : kDerivedFields) {
    if (const auto* value = derived.find(key)) CopyDictionary(key, *value, statistics);
  }
  for (const EANQuery& query : EANQueries()) {
    statistics.set(query.key, query.query(services, query.code));
  }
  Dictionary result = CreateFilteredDict_SigDig(std::move(statistics),
                                                &WhitelistedStorageStats_SigDigDict(), round);
  result.set(kTLM_APIErrorMessage, GetAPIErrorMessage());
  return result;
}

}  // namespace NANDInfo
