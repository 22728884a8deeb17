// What the steps of the extraction send of what the collectors made. Each returns what was sent.
#pragma once

#include <cstdint>

#include "NANDInfo/Services.h"
#include "plist/Value.h"

namespace NANDInfo {

// Three events of the FTL statistics: the counters and, in two parts, the histograms.
plist::Dictionary sendFTLStatistics(platform::SystemLog& log, platform::Eventra& eventra,
                                    const plist::Dictionary& ftl);

// One event for each MSP of a dictionary by index; the process's message in it is none. Of what was
// sent the result holds the last, under "msp_index". An event that the sink doesn't take is also
// recorded as the process's message.
plist::Dictionary sendMSPStatistics(platform::SystemLog& log, platform::Eventra& eventra,
                                    plist::Dictionary msps);

// One event of the storage statistics.
plist::Dictionary sendStorageStats(platform::SystemLog& log, platform::Eventra& eventra,
                                   const plist::Dictionary& storage);

// How full the boot variables' memory is and how often it was written: what there was to send, even
// if the sink didn't take it; empty without that memory's service.
plist::Dictionary sendNVRAMStatistics(const Services& services);

// The stats magazine's counters of the last day (0), week (1) or month (2); an error message for
// another type or without a magazine.
plist::Dictionary sendMagazine(const Services& services, std::int32_t deltaType);

}  // namespace NANDInfo
