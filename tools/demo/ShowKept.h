// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What stays on the device, as text for people.
#pragma once

#include <string>

#include "tools/demo/Device.h"

namespace demo {

// What a daily run leaves on the device: its records, the preferences that its tasking set, the
// support service's logs.
std::string showKept(Device& device);

}  // namespace demo
