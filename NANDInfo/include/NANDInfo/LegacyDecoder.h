// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The legacy statistics as a function of the bytes alone.
#pragma once

#include <cstddef>
#include <span>

#include "NANDInfo/Parsers.h"
#include "base/Exported.h"

namespace MORVEND_EXPORTED NANDInfo {

// Fills the context as ZMCParseBufferToCxt does. Whether the whole buffer could be read; what was
// read of it is in the context.
bool decodeLegacy(std::span<const std::byte> buffer, LegacyNandInfoCxt& context);

}  // namespace NANDInfo
