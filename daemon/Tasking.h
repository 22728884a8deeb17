// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Tasking: records of operating-system changes, preference changes that the analytics configuration
// schedules, and the report of log types that are switched off.
#pragma once

#include "daemon/Services.h"

namespace morvend {

// The three in this order. Records lie in the preferences of "com.norba.pellorand.morvend":
// "LastOSUpdate", "TaskingID", "TaskingOS", "TaskingDigest", "TaskingPayload".
void UpdateTaskingState(const Services& services);

}  // namespace morvend
