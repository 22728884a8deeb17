// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The verdict on the storage, for people and for scripts.
#pragma once

#include "tools/nandinfo/Commands.h"

namespace nandinfo {

// As StorageHealth.h describes it; the verdict is also the exit status. With `acknowledge` the
// errors until now are the baseline first; one that can't be kept is an error.
CommandResult healthVerdict(const Invocation& invocation);

}  // namespace nandinfo
