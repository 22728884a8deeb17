// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// MSP statistics as a function of the bytes alone: the buffer and the fields are those of
// ZMCMSPParseBufferToCxt, but what it would record as a message is handed back.
#pragma once

#include <cstddef>
#include <span>

#include "NANDInfo/GenericParserContext.h"
#include "base/Exported.h"

namespace MORVEND_EXPORTED NANDInfo {

// Appends the fields.
Decoded decodeMSP(std::span<const std::byte> buffer, GenericParserCxt* context);

}  // namespace NANDInfo
