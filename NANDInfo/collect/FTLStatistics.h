// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The FTL statistics as they come from the controller: one buffer, decoded.
#pragma once

#include <cstdint>
#include <optional>

#include "NANDInfo/Collectors.h"
#include "NANDInfo/controller/ControllerServices.h"
#include "base/Result.h"
#include "plist/Value.h"

namespace NANDInfo {

// All counters of a buffer, and whether the controller is a QRT1 and has a stats magazine; that it
// has none is noted as the process's message, too. `argument` is the hours of read statistics.
base::Result<plist::Dictionary> readFTLStatistics(const ControllerServices& services,
                                                  FTLParser parser, FTLSource source,
                                                  std::uint32_t argument);

// The statistics of now by name; none when they can't be had, which is then recorded.
std::optional<plist::Dictionary> ftlStatistics(const ControllerServices& services,
                                               const char* missing = nullptr);

}  // namespace NANDInfo
