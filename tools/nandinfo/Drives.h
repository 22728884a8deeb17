// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// This machine's drives, shown and recorded.
#pragma once

#include "tools/nandinfo/Commands.h"

namespace nandinfo {

// An array of their descriptions; or, with `record`, what became of each NVMe drive's record:
// {"name", "error" if there is one}.
CommandResult drives(const Invocation& invocation);

}  // namespace nandinfo
