// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The fields that go with the counters but come from the rest of the device.
#pragma once

#include <cstdint>

#include "NANDInfo/collect/CollectServices.h"
#include "plist/Value.h"

namespace NANDInfo {

// 1 when the device is in a shop's demo mode, else 0.
std::int32_t storeDemoMode(platform::PreferenceStore& preferences);

// The purgeable and non-purgeable space, as far as known.
plist::Dictionary purgeableSpace(platform::PurgeableSpace& space);

// Both of these, the kernel's swap-out and the disk: all that doesn't need the controller.
plist::Dictionary deviceFields(const CollectServices& services);

// The device's fields and those that are derived from the FTL counters, as far as there are any
// (null: that there are none is noted as the process's message).
plist::Dictionary otherFields(const CollectServices& services, const plist::Dictionary* ftl);

}  // namespace NANDInfo
