// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Reads this machine's NVMe drives, which takes rights that nobody else here has.
#pragma once

#include "base/Result.h"
#include "host/files/DeviceRoot.h"
#include "tools/nandinfo/Commands.h"

namespace recorder {

// Asks each NVMe drive below `machine` for its standard health log and its identity, and keeps both
// as they are, uninterpreted, as the drive's record (host/machine/DriveRecord.h). Every drive is
// tried; the error is of what all of them need: the folder for the records.
base::Result<nandinfo::RecordedDrives> recordDrives(const host::DeviceRoot& machine);

}  // namespace recorder
