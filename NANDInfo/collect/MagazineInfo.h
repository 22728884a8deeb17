// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The stats magazine's windows, from the controller's snapshots.
#pragma once

#include <cstdint>

#include "NANDInfo/Magazine.h"
#include "NANDInfo/collect/CollectServices.h"
#include "plist/Value.h"

namespace NANDInfo {

// What CopySMagNANDFTLInfo promises.
plist::Dictionary magazineInfo(const CollectServices& services, std::uint64_t hours,
                               bool differences, std::uint32_t mode);

// What CopySMagNANDFTLCustomHistoryInfo promises.
plist::Dictionary magazineHistory(const ControllerServices& services, bool skips);

}  // namespace NANDInfo
