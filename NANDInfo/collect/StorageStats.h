// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The storage statistics: a few derived fields, and the EAN service's images.
#pragma once

#include "NANDInfo/collect/CollectServices.h"
#include "plist/Value.h"

namespace NANDInfo {

// Whitelisted, rounded if wanted, with the process's message.
plist::Dictionary storageStats(const CollectServices& services, bool round);

}  // namespace NANDInfo
