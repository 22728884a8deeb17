// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// This machine's drives, as its registry describes them.
#pragma once

#include <vector>

#include "plist/Value.h"
#include "tools/nandinfo/Commands.h"

namespace platform {
class DeviceRegistry;
}

namespace nandinfo {

// The description of every drive (platform::kRegistryDriveKey), in the registry's order. A recorded
// device has none, whatever its controller.
std::vector<plist::Dictionary> describedDrives(platform::DeviceRegistry& registry);

// An array of these; or, with `record`, what became of each NVMe drive's record: {"name", "error"
// if there is one}.
CommandResult drives(const Invocation& invocation);

}  // namespace nandinfo
