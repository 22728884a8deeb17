// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Whole weeks since 2000, in which the time of the last format is reported.
#pragma once

#include <cstdint>

namespace NANDInfo {

// 0 for what is earlier.
constexpr std::int64_t weeksSince2000(std::uint64_t secondsSince1970) {
  constexpr std::uint64_t kYear2000 = 946684800, kWeek = 604800;
  if (secondsSince1970 < kYear2000) return 0;
  return static_cast<std::int64_t>((secondsSince1970 - kYear2000) / kWeek);
}

}  // namespace NANDInfo
