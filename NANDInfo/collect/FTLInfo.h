// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The FTL statistics as they are handed on.
#pragma once

#include "NANDInfo/collect/CollectServices.h"
#include "plist/Value.h"

namespace NANDInfo {

// With what is derived from them and the rest of the device, whitelisted and rounded if wanted. As
// in all that follows the result holds the process's message, and without a controller only that.
plist::Dictionary whitelistedFTLInfo(const CollectServices& services, bool round);

// As they are, under their names or under "Stat_<key>".
plist::Dictionary wholeFTLInfo(const ControllerServices& services, bool statKeys);

// The derived fields that go with the MSP and storage statistics; empty without a controller.
plist::Dictionary fieldsAlong(const CollectServices& services);

}  // namespace NANDInfo
