// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// How much more the flash was written than the host asked for.
#pragma once

#include <optional>

#include "NANDInfo/Parsers.h"
#include "plist/Value.h"

namespace NANDInfo {

// Rounded to single precision. Without host writes they are infinite, or not a number.
struct WriteAmplification {
  double user = 0;
  double intermediate = 0;  // of the blocks that buffer writes; 0 where there are none
};

WriteAmplification writeAmplificationOf(const LegacyNandInfoCxt& context);

// Whether a write amplification is worth a report: above the threshold that the preference
// ("userWAmp") sets, a real number between 0 and 10, and without one above 2.
bool isHighWriteAmplification(double user, const std::optional<plist::Value>& preference);

}  // namespace NANDInfo
