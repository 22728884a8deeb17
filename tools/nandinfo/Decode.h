// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Captured buffers, decoded without a controller.
//
// FILE is an ordinary path of the calling process, "-" its standard input; at most 16 MiB are read.
#pragma once

#include "tools/nandinfo/Commands.h"

namespace nandinfo {

// As DecodedBuffer.h has them.
CommandResult decodeFTL(const Invocation& invocation);
CommandResult decodeFTLStat(const Invocation& invocation);
CommandResult decodeLegacy(const Invocation& invocation);
CommandResult decodeMSP(const Invocation& invocation);
CommandResult decodeValidity(const Invocation& invocation);
CommandResult decodeTelemetry(const Invocation& invocation);
CommandResult decodeDefects(const Invocation& invocation);
CommandResult decodeSnapshot(const Invocation& invocation);

// The words of the common layout, from the file's first counter block; one that ends after the
// words that the layout reads is taken for the rest as zeros.
CommandResult decodeCounters(const Invocation& invocation);

}  // namespace nandinfo
