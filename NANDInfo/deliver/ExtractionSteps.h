// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What the steps of the extraction send of what the collectors made. Each returns what was sent.
#pragma once

#include <cstdint>

#include "NANDInfo/collect/CollectServices.h"
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

// One event of the boot variables' memory, if there is anything to send; the result is that, even
// if the sink didn't take it.
plist::Dictionary sendNVRAMStatistics(platform::Eventra& eventra, plist::Dictionary statistics);

// The stats magazine's counters of the last day (0), week (1) or month (2); an error message for
// another type or without a magazine.
plist::Dictionary sendMagazine(platform::SystemLog& log, platform::Eventra& eventra,
                               const CollectServices& services, std::int32_t deltaType);

}  // namespace NANDInfo
