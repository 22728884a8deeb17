// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The steps between the controller's buffers and the library's results.
#pragma once

#include <cstdint>
#include <optional>

#include "NANDInfo/Parsers.h"
#include "NANDInfo/Services.h"
#include "base/Exported.h"
#include "plist/Value.h"

namespace MORVEND_EXPORTED NANDInfo {

enum class FTLParser { named, statKey };
enum class FTLSource { statistics, readStatistics };

// All counters of an FTL buffer, and whether the controller is a QRT1 and has a stats magazine;
// none when there is no controller or it has no answer. `argument` is the hours of read statistics.
std::optional<plist::Dictionary> gatherZMCFTLData(const Services& services, FTLParser parser,
                                                  FTLSource source, std::uint32_t argument);

// The fields derived from an FTL dictionary (null: there is none) and from the rest of the device.
plist::Dictionary gatherZMCFTLOtherData(const Services& services, const plist::Dictionary* ftl);

// The derived fields that go with the MSP and storage statistics.
plist::Dictionary gatherZMCOtherData(const Services& services);

// The basic dictionary of a legacy context; the demo mode is the only thing asked of the platform.
plist::Dictionary buildLegacyNANDInfoDict(const Services& services,
                                          const LegacyNandInfoCxt& context, bool leavesOutVersions);

// The purgeable and non-purgeable space, as far as known.
plist::Dictionary getSpacereapInfo(const Services& services);

// Six health figures from the FTL statistics; empty without them.
plist::Dictionary gatherNANDHealthInfo(const Services& services);

// 1 when the device is in a shop's demo mode, else 0.
std::int32_t storeDemoMode(const Services& services);

}  // namespace NANDInfo
