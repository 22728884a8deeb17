// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The device health values that are collected beside the counters report.
#pragma once

#include "daemon/Services.h"

namespace morvend {

// Runs the collectors, each whatever became of the others: disk usage, the storage log, storage
// health, memory error events, data usage and the kernel's reporting channels. What they find goes
// to today's counters or, as structured data, to the crash-reporting support library.
void CollectDailyTelemetry(const Services& services);

}  // namespace morvend
