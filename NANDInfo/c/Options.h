// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The options of the C interface, checked.
#pragma once

#include <cstdint>

#include "NANDInfo/c/nandinfo.h"
#include "NANDInfo/queries/BufferDecoders.h"
#include "NANDInfo/queries/Queries.h"
#include "base/Result.h"

namespace NANDInfo {

struct Options : QueryOptions, BufferOptions {};

// What the caller gave, of whatever version of the structure, for a name that takes these (of
// QueryTakes and BufferTakes). Fails when it isn't taken, doesn't fit together or isn't known, and
// when something is missing that there must be.
base::Result<Options> readOptions(const nandinfo_options* given, std::uint16_t takes);

}  // namespace NANDInfo
