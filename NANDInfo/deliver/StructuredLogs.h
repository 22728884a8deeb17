// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The dump of the storage controller's diagnostic lists.
#pragma once

#include "NANDInfo/Services.h"

namespace NANDInfo {

// What DumpStorageStructuredLog promises, with the process's flag that the validity list is wanted
// always.
bool dumpStructuredLogs(const Services& services, bool flag, bool forceCollection);

}  // namespace NANDInfo
