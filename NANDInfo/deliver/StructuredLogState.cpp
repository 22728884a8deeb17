// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/deliver/StructuredLogState.h"

#include "NANDInfo/collect/WriteAmplification.h"

namespace NANDInfo {

StructuredLogState structuredLogState(const LegacyNandInfoCxt* statistics,
                                      const std::optional<plist::Value>& preference,
                                      bool forceCollection) {
  const auto amplification =
      statistics != nullptr ? writeAmplificationOf(*statistics) : WriteAmplification();
  return {.gForceCollectionSet = forceCollection,
          .gNeedValidityList =
              forceCollection || isHighWriteAmplification(amplification.user, preference),
          .gCurrentUserWamp = amplification.user,
          .gCurrentSysWamp = amplification.intermediate};
}

}  // namespace NANDInfo
