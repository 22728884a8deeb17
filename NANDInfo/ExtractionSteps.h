// The steps of the extraction that send what a collector made of the controller's statistics. Each
// returns what was sent; only an error message when the collector has nothing.
#pragma once

#include <optional>

#include "platform/PropertyList.h"

namespace platform {
struct Platform;
}

namespace NANDInfo {

// Three events of the FTL statistics: the counters and, in two parts, the histograms.
platform::Dictionary createAndLogFTLStatFieldsToEventraForEvent(
    platform::Platform& platform, const std::optional<platform::Dictionary>& ftl);

// One event for each MSP of a dictionary by index. Of what was sent the result holds the last,
// under "msp_index".
platform::Dictionary createAndLogMSPFieldsToEventraForEvent(
    platform::Platform& platform, std::optional<platform::Dictionary> msps);

// One event of the storage statistics.
platform::Dictionary createAndLogStorageStatsToEventraForEvent(
    platform::Platform& platform, const std::optional<platform::Dictionary>& storage);

}  // namespace NANDInfo
