// The health figures of the FTL statistics, and who gets which of them.
#pragma once

#include "NANDInfo/Services.h"
#include "plist/Value.h"

namespace NANDInfo {

// Six figures of FTL counters.
plist::Dictionary healthFigures(const plist::Dictionary& ftl);

// The same of the controller's statistics; empty without them.
plist::Dictionary healthInfo(const Services& services);

// Those for the warranty service, for internal lab tools (with whether the flash may be retired)
// and for system updates.
plist::Dictionary servitaInfo(const Services& services);
plist::Dictionary internalLabInfo(const Services& services);
plist::Dictionary otaInfo(const Services& services);

}  // namespace NANDInfo
