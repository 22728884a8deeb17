// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The health figures of the FTL statistics, and who gets which of them.
#pragma once

#include "NANDInfo/controller/ControllerServices.h"
#include "plist/Value.h"

namespace NANDInfo {

// Six figures of FTL counters.
plist::Dictionary healthFigures(const plist::Dictionary& ftl);

// The same of the controller's statistics; empty without them.
plist::Dictionary healthInfo(const ControllerServices& services);

// Those for the warranty service, for internal lab tools (with whether the flash may be retired)
// and for system updates.
plist::Dictionary servitaInfo(const ControllerServices& services);
plist::Dictionary internalLabInfo(const ControllerServices& services);
plist::Dictionary otaInfo(const ControllerServices& services);

}  // namespace NANDInfo
