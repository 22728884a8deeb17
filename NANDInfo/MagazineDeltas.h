// The arithmetic of the stats magazine, over snapshots that somebody else has fetched.
#pragma once

#include <cstdint>
#include <optional>

#include "platform/PropertyList.h"

namespace NANDInfo {

// Adds a snapshot's time, from its packed metadata, if it has them.
void addMagazineTimeStamp(platform::Dictionary& snapshot);

// The time between two snapshots in days, negative when the newer has the earlier time; none when
// a time is missing.
std::optional<double> magazineDeltaDays(const platform::Dictionary& newer,
                                        const platform::Dictionary& older);

// The counters that both snapshots have, in the order of the older: accumulating ones as doubles
// (the difference, or the older's value), dynamic ones as the older has them; `mode` is that of
// CopySMagNANDFTLInfo.
platform::Dictionary magazineDeltas(const platform::Dictionary& newer,
                                    const platform::Dictionary& older, bool differences,
                                    std::uint32_t mode);

// Sets the average P/E cycles of a window, from its erases and the partitions' sizes; each only
// when all that it takes is there.
void setAveragePECycles(platform::Dictionary& window, const platform::Dictionary& statistics);

// The write amplification of garbage collection between two snapshots, after the validity curve of
// the older one: bands are collected from the emptiest bucket on until one is gained, each bucket
// being 3.3 % fuller than the one before; the last bucket's share of gain decides. The number 0
// when nothing was collected or no time has passed.
platform::Value instantaneousWriteAmplification(const platform::Dictionary& newer,
                                                const platform::Dictionary& older);

}  // namespace NANDInfo
