// The network data usage of each process, once a day.
#pragma once

#include <chrono>

#include "daemon/Services.h"

namespace morvend {

inline constexpr std::chrono::seconds kUsageServicePatience(10);

// Asks the usage service and waits for its reply to be dealt with, for at most `patience`. The
// reply adds to today's counters and replaces the baseline: "netUsageBaseline" in the domain
// "com.norba.quenset.morvend". A late one does so too, on the service's thread, while the process
// lives; it holds its own references to the platform's services.
void CollectDataUsage(const Services& services,
                      std::chrono::nanoseconds patience = kUsageServicePatience);

}  // namespace morvend
