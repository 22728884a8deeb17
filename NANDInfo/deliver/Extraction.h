// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The extraction: the steps of its table, one after the other.
#pragma once

#include <cstdint>
#include <optional>

#include "NANDInfo/Extraction.h"
#include "NANDInfo/Services.h"
#include "plist/Value.h"

namespace NANDInfo {

// Runs one step of the table; what it sent, or none when there is no such step. Without a lazy send
// on this device the result is an error message.
std::optional<plist::Dictionary> runExtractionStep(const Services& services, std::uint32_t step);

// Runs the steps from the first one on, the monthly one only when that is allowed; all that they
// sent, of equal keys the later.
plist::Dictionary runExtraction(const Services& services, std::uint32_t firstStep,
                                bool allowsMonthly);

}  // namespace NANDInfo
