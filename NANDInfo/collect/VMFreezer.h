// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The writes of the kernel's swap-out thread.
#pragma once

#include "plist/Value.h"

namespace platform {
class KernelSnapshots;
}

namespace NANDInfo {

// How many bytes it has written, under two keys; empty when that isn't known.
plist::Dictionary swapOutInfo(platform::KernelSnapshots& snapshots);

}  // namespace NANDInfo
