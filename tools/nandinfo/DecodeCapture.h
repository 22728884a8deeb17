// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// A whole captured device, decoded.
#pragma once

#include "tools/nandinfo/Commands.h"

namespace nandinfo {

// DIR is an ordinary path of the calling process: a folder in the form of a root's device/ folder.
// Its files may have 16 MiB together, and none is read that lies outside.
//
// {"ok": whether there is anything to decode and all of it could be, "class": that of the
// controller, then each buffer as it is decoded alone, under its name and argument as in the
// capture's manifest ("statistics 0"), the kernel snapshot under "kernel-snapshot"; "undecoded":
// the buffers for which there is no decoder; "error"}.
CommandResult decodeCapture(const Invocation& invocation);

}  // namespace nandinfo
