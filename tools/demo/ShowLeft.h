// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What left the device, as text for people.
#pragma once

#include <string>

#include "tools/demo/Device.h"

namespace demo {

// Everything that left the device, each part with the rule that let it through: the logs in the
// spool, today's counters as far as the telemetry set them, structured logs, events, and what the
// storage library hands to its callers.
std::string showLeft(Device& device, bool all);

}  // namespace demo
