// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Captured buffers, decoded without a controller.
#pragma once

#include "tools/nandinfo/Commands.h"

namespace nandinfo {

// What the decoder makes of a file: an ordinary path of the calling process, "-" its standard
// input; at most 16 MiB are read. An error names the file.
CommandResult decodeFile(const NANDInfo::BufferDecoder& decoder, const Arguments& arguments);

}  // namespace nandinfo
