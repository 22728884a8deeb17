// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The user data volume: its size, and how full it is.
#pragma once

#include "plist/Value.h"

namespace platform {
class DeviceProperties;
class FileSystem;
}  // namespace platform

namespace NANDInfo {

// Six figures, as the file system has them; as the device's properties have them where it doesn't
// know the volume, or has it empty. What isn't known is 0.
plist::Dictionary diskInfo(platform::FileSystem& files, platform::DeviceProperties& properties);

}  // namespace NANDInfo
