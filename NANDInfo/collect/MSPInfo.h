// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The statistics of each media storage processor.
#pragma once

#include "NANDInfo/collect/CollectServices.h"
#include "base/Result.h"
#include "plist/Value.h"

namespace NANDInfo {

// All counters of each MSP under its index in decimal, as far as they could be read; where that
// ended early, why is noted as the process's message. No driver is open when it returns.
base::Result<plist::Dictionary> readMSPStatistics(const ControllerServices& services);

// An MSP's whitelisted counters, rounded if wanted, with the fields that all MSPs share and the
// parts of its firmware's version.
plist::Dictionary reportedMSP(const plist::Dictionary& counters, const plist::Dictionary& shared,
                              bool round);

// All MSPs so, under their indices, and the process's message.
plist::Dictionary whitelistedMSPInfo(const CollectServices& services, bool round);

}  // namespace NANDInfo
