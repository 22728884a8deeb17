// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The basic dictionary, for the counters service: the legacy statistics under its keys.
#pragma once

#include "NANDInfo/Parsers.h"
#include "NANDInfo/collect/CollectServices.h"
#include "base/Result.h"
#include "plist/Value.h"

namespace NANDInfo {

// The controller's legacy statistics; what went wrong with the driver is on standard error.
base::Result<LegacyNandInfoCxt> readLegacyStatistics(const ControllerServices& services);

// The same under the counters service's keys, with the purgeable space; only the two error keys
// without it.
plist::Dictionary basicInfo(const CollectServices& services);

// Whether the day's storage counters go to the analytics sink instead of the counters service:
// every other day, from the first or the second of a boot session, by the first character of its
// identifier. Not when that isn't known.
bool belongsToSink(char session, plist::Date today);
bool belongsToSink(platform::Kernel& kernel, platform::Clock& clock);

}  // namespace NANDInfo
