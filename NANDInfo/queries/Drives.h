// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// This machine's drives, as its registry describes them.
#pragma once

#include "plist/Value.h"

namespace platform {
class DeviceRegistry;
}

namespace NANDInfo {

// The description of every drive (platform::kRegistryDriveKey), a dictionary each, in the
// registry's order. A recorded device has none, whatever its controller.
plist::Array describedDrives(platform::DeviceRegistry& registry);

}  // namespace NANDInfo
