// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/collect/FTLInfo.h"

#include <utility>

#include "NANDInfo/APIErrorMessage.h"
#include "NANDInfo/Keys.h"
#include "NANDInfo/Utilities.h"
#include "NANDInfo/Whitelists.h"
#include "NANDInfo/collect/DerivedFields.h"
#include "NANDInfo/collect/DeviceFields.h"
#include "NANDInfo/collect/FTLStatistics.h"
#include "NANDInfo/collect/Recorded.h"

namespace NANDInfo {

using plist::Dictionary;

Dictionary whitelistedFTLInfo(const CollectServices& services, bool round) {
  auto counters = ftlStatistics(services.controller,
                                "CopyWhitelistedNANDFTLInfo: Unable to gather other FTL fields");
  if (counters) addEntries(otherFields(services, &*counters), *counters);
  Dictionary info = CreateFilteredDict_SigDig(std::move(counters).value_or(Dictionary()),
                                              &WhitelistedRawNANDFTLCounters_SigDigDict(), round);
  info.set(kTLM_APIErrorMessage, GetAPIErrorMessage());
  return info;
}

Dictionary wholeFTLInfo(const ControllerServices& services, bool statKeys) {
  const auto parser = statKeys ? FTLParser::statKey : FTLParser::named;
  Dictionary info =
      recorded(readFTLStatistics(services, parser, FTLSource::statistics, 0),
               "CopyWhitelistedNANDFTLInfo: Unable to gather other stats magazine deltas")
          .value_or(Dictionary());
  info.set(kTLM_APIErrorMessage, GetAPIErrorMessage());
  return info;
}

Dictionary fieldsAlong(const CollectServices& services) {
  const auto ftl =
      ftlStatistics(services.controller, "gatherZMCOtherData: Unable to get FTL counters");
  return ftl ? sharedFields(otherFields(services, &*ftl)) : Dictionary();
}

}  // namespace NANDInfo
