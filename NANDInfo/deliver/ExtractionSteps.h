// The steps of the extraction that send what a collector made of the controller's statistics. Each
// returns what was sent; only an error message when the collector has nothing.
#pragma once

#include <optional>

#include "NANDInfo/Services.h"
#include "plist/Value.h"

namespace NANDInfo {

// Three events of the FTL statistics: the counters and, in two parts, the histograms.
plist::Dictionary createAndLogFTLStatFieldsToEventraForEvent(
    const Services& services, const std::optional<plist::Dictionary>& ftl);

// One event for each MSP of a dictionary by index. Of what was sent the result holds the last,
// under "msp_index".
plist::Dictionary createAndLogMSPFieldsToEventraForEvent(const Services& services,
                                                         std::optional<plist::Dictionary> msps);

// One event of the storage statistics.
plist::Dictionary createAndLogStorageStatsToEventraForEvent(
    const Services& services, const std::optional<plist::Dictionary>& storage);

}  // namespace NANDInfo
