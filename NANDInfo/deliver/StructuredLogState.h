// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What a dump of the diagnostic lists works out before it fetches them, and hands to their
// handlers.
#pragma once

#include <optional>

#include "NANDInfo/Parsers.h"
#include "plist/Value.h"

namespace NANDInfo {

struct StructuredLogState {
  bool gForceCollectionSet = false;  // the process's flag, as it was when the dump began
  bool gNeedValidityList = false;
  double gCurrentUserWamp = 0;  // write amplification, as WriteAmplification.h has it
  double gCurrentSysWamp = 0;   // the same of the intermediate blocks
};

// Of the legacy statistics (null: they can't be had, and nothing is amplified), the preference
// "userWAmp" and the process's flag: the validity list is wanted when the flag is set or the user's
// write amplification is high.
StructuredLogState structuredLogState(const LegacyNandInfoCxt* statistics,
                                      const std::optional<plist::Value>& preference,
                                      bool forceCollection);

}  // namespace NANDInfo
