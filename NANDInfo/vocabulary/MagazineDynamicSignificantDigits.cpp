// The counters of the stats magazine that are reported as they stood.
#include "NANDInfo/vocabulary/NameRows.h"

namespace NANDInfo {

namespace {

constexpr NameRow kRows[] = {
    {"coldestCycle_{0, 1}", 8},
    {"hottestCycle_{0, 1}", 8},
    {"IND_pool_count", 8},
    {"IND_pool_free", 8},
    {"maxFailedFastCxtSync", 8},
    {"maxHighEnduranceBlockErases", 8},
    {"maxMemChokeDuration", 8},
    {"maxMemExtremeDuration", 8},
    {"memChokeDuration", 8},
    {"memExtremeDuration", 8},
    {"numFreeVirtualBlocks", 8},
    {"numMemExtreme", 8},
    {"overWritesPerHostFlow_{0..3}", 8},
    {"staticSizeInMB", 8},
    {"unmapsPerHostFlow_{0..3}", 8},
    {"averageGracefulBootTimeMs", 5},
    {"averageUngracefulBootTimeMs", 5},
    {"eanAvgBootReadMBPerSec", 5},
    {"eanAvgBootReadTimeMs", 5},
    {"eanAvgInitTimeMs", 5},
    {"eanAvgToFirstReadTimeMs", 5},
    {"eanMaxBootReadTimeMs", 5},
    {"eanMinBootReadMBPerSec", 5},
    {"maxGracefulBootTimeMs", 5},
    {"maxUngracefulBootTimeMs", 5},
    {"wcacheSectorsCur", 5},
    {"avgBgInitTimeMs", 4},
    {"eanMaxInitTimeMs", 4},
    {"eanMinToFirstReadTimeMs", 4},
    {"maxBgInitTimeMs", 4},
    {"averageSkinnyPECycles", 6},
    {"maxSkinnyPECycles", 6},
    {"minSkinnyPECycles", 6},
};

static_assert(countNames(kRows) == 41);

}  // namespace

std::span<const NameRow> magazineDynamicSignificantDigitsRows() { return kRows; }

}  // namespace NANDInfo
