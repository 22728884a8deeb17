// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Opens a path below a folder without openat2, which older kernels lack and some sandboxes refuse.
#pragma once

#include <string_view>

#include "base/Result.h"
#include "host/files/FileDescriptor.h"

namespace host {

enum class Links { refused, followed };

// Opens a path below an open folder, one part after the other. ".." leads no higher than the folder
// and a link's absolute target begins at it, so that the folder is the root of all that is found.
// Links are refused (ELOOP), the last part included, or followed, 40 at most. `flags` are openat's,
// for files that are there.
base::Result<FileDescriptor> openByWalk(int folder, std::string_view path, int flags, Links links);

}  // namespace host
