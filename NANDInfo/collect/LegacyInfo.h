// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The legacy statistics under the counters service's keys.
#pragma once

#include <cstdint>
#include <optional>

#include "NANDInfo/GenericParserContext.h"
#include "NANDInfo/Parsers.h"
#include "plist/Value.h"

namespace NANDInfo {

// A legacy context under the keys; with the versions and the demo mode, or without all three.
plist::Dictionary legacyInfo(const LegacyNandInfoCxt& context,
                             std::optional<std::int32_t> demoMode);

}  // namespace NANDInfo
