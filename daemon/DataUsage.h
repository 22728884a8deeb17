// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The network data usage of each process, once a day.
#pragma once

#include <chrono>

#include "platform/CountersService.h"
#include "platform/NetworkUsage.h"
#include "platform/PreferenceStore.h"
#include "platform/SystemLog.h"

namespace morvend {

inline constexpr std::chrono::seconds kUsageServicePatience(10);

// Asks the usage service and waits for its reply to be dealt with, for at most `patience`. The
// reply adds to today's counters and replaces the baseline: "netUsageBaseline" in the domain
// "com.norba.quenset.morvend". Both or neither: what a run that was ended in between has counted is
// not counted again, and where the counters can't be recorded the baseline stays. A late one does
// so too, on the service's thread, while the process lives; counters, preferences and log are all
// that it uses, and must live as long as the service.
void CollectDataUsage(platform::NetworkUsage& networkUsage, platform::CountersService& counters,
                      platform::PreferenceStore& preferences, platform::SystemLog& log,
                      std::chrono::nanoseconds patience = kUsageServicePatience);

}  // namespace morvend
