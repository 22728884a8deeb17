// The basic dictionary, for the counters service: the legacy statistics under its keys.
#pragma once

#include <cstdint>
#include <optional>

#include "NANDInfo/Parsers.h"
#include "NANDInfo/Services.h"
#include "base/Result.h"
#include "plist/Value.h"

namespace NANDInfo {

// The controller's legacy statistics; what went wrong with the driver is on standard error.
base::Result<LegacyNandInfoCxt> readLegacyStatistics(const Services& services);

// A legacy context under the keys; with the versions and the demo mode, or without all three.
plist::Dictionary legacyInfo(const LegacyNandInfoCxt& context,
                             std::optional<std::int32_t> demoMode);

// The controller's, with the purgeable space; only the two error keys without it.
plist::Dictionary basicInfo(const Services& services);

// Whether the day's storage counters go to the analytics sink instead of the counters service:
// every other day, from the first or the second of a boot session, by the first character of its
// identifier. Not when that isn't known.
bool belongsToSink(char session, plist::Date today);
bool belongsToSink(platform::Kernel& kernel, platform::Clock& clock);

}  // namespace NANDInfo
