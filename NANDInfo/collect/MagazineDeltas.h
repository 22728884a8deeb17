// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The arithmetic of the stats magazine, over snapshots that somebody else has fetched.
#pragma once

#include <cstdint>
#include <optional>

#include "base/Result.h"
#include "plist/Value.h"

namespace NANDInfo {

// Adds a snapshot's time, from its packed metadata, if it has them.
void addMagazineTimeStamp(plist::Dictionary& snapshot);

// The time between two snapshots in days, negative when the newer has the earlier time; none when
// a time is missing.
std::optional<double> magazineDeltaDays(const plist::Dictionary& newer,
                                        const plist::Dictionary& older);

// The days between two snapshots and the counters that both have, in the order of the older:
// accumulating ones as doubles (the difference if it is wanted and time has passed, else the
// older's value), dynamic ones as the older has them; `mode` is that of CopySMagNANDFTLInfo.
base::Result<plist::Dictionary> magazineWindow(const plist::Dictionary& newer,
                                               const plist::Dictionary& older, bool differences,
                                               std::uint32_t mode);

// Sets the average P/E cycles of a window, from its erases and the partitions' sizes; each only
// when all that it takes is there.
void setAveragePECycles(plist::Dictionary& window, const plist::Dictionary& statistics);

// The write amplification of garbage collection between two snapshots, after the validity curve of
// the older one: bands are collected from the emptiest bucket on until one is gained, each bucket
// being 3.3 % fuller than the one before; the last bucket's share of gain decides. The number 0
// when nothing was collected or no time has passed.
plist::Value instantaneousWriteAmplification(const plist::Dictionary& newer,
                                             const plist::Dictionary& older);

}  // namespace NANDInfo
