// The device health values that are collected beside the counters report.
#pragma once

#include "daemon/context/DeviceContext.h"
#include "platform/Platform.h"

namespace morvend {

// Collects them and hands them on. No collector has been added yet.
void CollectDailyTelemetry(platform::Platform& platform, DeviceContext& context);

}  // namespace morvend
