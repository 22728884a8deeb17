// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The stats magazine: what the FTL counters came to over a window of time.
//
// A controller that keeps a magazine answers for the snapshot of its counters that lies a number of
// hours back, 0 being the newest. How deep it goes is its own business: a snapshot that it doesn't
// serve is a missing one.
#pragma once

#include <cstdint>

#include "NANDInfo/Services.h"
#include "base/Exported.h"
#include "plist/Value.h"

namespace MORVEND_EXPORTED NANDInfo {

// Which counters CopySMagNANDFTLInfo reports, by its mode; any other mode reports none.
inline constexpr std::uint32_t kMagazineAccumulating = 0;
inline constexpr std::uint32_t kMagazineDynamic = 1;
inline constexpr std::uint32_t kMagazineBoth = 2;

// The accumulating counters of the last `hours` as differences (with a zero delta flag, or when no
// time has passed, as they were then), the dynamic ones as they were then; with the derived fields
// and the average P/E cycles of the window. With only the older snapshot, all that it holds. Depths
// beyond 32 bits are cut to what the driver takes.
plist::Dictionary CopySMagNANDFTLInfo(const Services& services, std::uint64_t hours,
                                      std::uint32_t deltaFlag, std::uint32_t mode);

// The write amplification of garbage collection in each of the last six windows of four hours, the
// latest first: kTLM_instantaneous_gc_wamp_array. Nothing when `skips` is not zero; without a
// magazine only an error message.
plist::Dictionary CopySMagNANDFTLCustomHistoryInfo(const Services& services, std::uint32_t skips);

}  // namespace NANDInfo
