// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The statistics of the boot variables' memory.
#pragma once

#include "NANDInfo/DriverService.h"
#include "plist/Value.h"

namespace NANDInfo {

// How full it is and how often it was written, as far as its service says; empty without one.
plist::Dictionary nvramInfo(const DriverAccess& access);

}  // namespace NANDInfo
