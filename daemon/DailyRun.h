// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The once-a-day gate and the daily sequence.
#pragma once

#include <cstdint>

#include "daemon/Services.h"
#include "device/DeviceContext.h"
#include "report/PLReport.h"

namespace morvend {

using report::ActivatedAppInfo;

// Runs the daily sequence for yesterday, unless the gate record in the preferences says that it has
// already run for yesterday or a later day; the record is written once the sequence is through.
// While a record is there that can't be read, nothing is run, and an error line says why.
// `appInfo` may be null. Holds the run lock, so that of two processes one runs and the other finds
// the gate closed.
void RunDailyTasksIfDue(const Services& services, DeviceContext& context,
                        const ActivatedAppInfo* appInfo);

// Runs the daily sequence for a day, whatever the gate record says, and leaves the record alone.
// Holds the run lock.
void RunDailyTasks(const Services& services, DeviceContext& context, std::int32_t day,
                   const ActivatedAppInfo* appInfo);

}  // namespace morvend
