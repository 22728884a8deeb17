// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Files that hold lines, and lines that wait beside them (see Pending) until they belong there.
#pragma once

#include <sys/types.h>

#include <functional>
#include <optional>
#include <string>

#include "base/Result.h"
#include "host/files/FileLock.h"
#include "host/files/Pending.h"

namespace host {

// The end of the last line that ends within [from, to), or `to` where none does.
off_t lastLineEnd(int file, off_t from, off_t to);

// Appends the bytes [start, end) of one open file to another.
base::Result<void> copyBytes(int from, off_t start, off_t end, int to);

// Brings the files that wait in an open folder to disk, and their names.
base::Result<void> synchronisePending(int folder);

// Deals with all that waits in an open folder: appends its lines to the file that they are for
// where `leaves` says so of the run's day, removes them where it doesn't. Each line is appended
// once, even if earlier calls were killed in the middle. `makeRoom(name, bytes)` comes before lines
// are appended to a file that is there. The first failure, after the others were tried.
using Leaves = std::function<bool(const std::optional<std::int32_t>& day)>;
using MakeRoom = std::function<base::Result<void>(const std::string& name, std::uint64_t bytes)>;
base::Result<void> settleLines(int folder, const Leaves& leaves, const MakeRoom& makeRoom,
                               const LockWait& wait);

}  // namespace host
