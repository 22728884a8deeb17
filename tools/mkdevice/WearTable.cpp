// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// name, base, what it grows with, multiplier, divisor, most; part of a name, growth, figure
#include "tools/mkdevice/Wear.h"

namespace mkdevice {

namespace {

using enum Growth;

// clang-format off
constexpr WearCounter kWearCounters[] = {
    {"version", 4},
    {"exportVersion", 9},
    {"qm7FwVer", 2107},
    {"nandDesc", kNANDDescription},
    {"fw_version_identifier", 0x0011'0004'0002'0B5F},
    {"magazineFWVersion", 17},
    {"bytesPerPage", kBytesPerPage},
    {"pagesPerVirtualBlock", kPagesPerBand},
    {"pagesPerVirtualBlockSlc", kPagesPerFastBand},
    {"blocksPerVirtualBlock", 64},
    {"numVirtualBlocks", kBands},
    {"intermediatePartitionStart", kFirstFastBand},
    {"userPartitionStart", kFirstUserBand},
    {"nofDies", 16},
    {"mspBootBlockCountPerMsp", 4},
    {"IND_pool_count", 98304},
    {"TurboRaidIsEnabled", 1},
    {"numFactoryBad", kFactoryBadBlocks},
    {"numDieFailures", 0},
    {"spareAvailablePercent", 100},

    {"utilFormatTime", 0, &Wear::formatTime},
    {"calendarTime", 0, &Wear::time},
    {"wallTime", 0, &Wear::time},
    {"magazineInstanceMeta", 0, &Wear::magazineMeta},
    {"powerOnHours", 0, &Wear::hours, 2, 5},
    {"powerOnSeconds", 0, &Wear::hours, 1440},
    {"boots", 2, &Wear::hours, 1, kHoursPerBoot},
    {"shutdowns", 1, &Wear::hours, 1, 240},
    {"uncleanBoots", 0, &Wear::hours, 1, 2400},
    {"numSleepOps", 0, &Wear::hours, 13},
    {"numGrownBad", 0, &Wear::hours, 1, kHoursPerBadBlock},
    {"fwUpdatesPercentUsed", 1, &Wear::hours, 1, 8000, 100},

    {"hostWrites", 0, &Wear::hostWrites},
    {"hostWriteXacts", 0, &Wear::hostWrites, 1, 9},
    {"hostWritesDyn", 0, &Wear::hostWrites, 1, 2},
    {"hostWritesStatic", 0, &Wear::hostWrites, 1, 4},
    {"hostWritesMeta", 0, &Wear::hostWrites, 1, 16},
    {"hostWritesPhoto", 0, &Wear::hostWrites, 1, 8},
    {"hostReads", 0, &Wear::hostReads},
    {"hostReadXacts", 0, &Wear::hostReads, 1, 14},
    {"nandWrites", 0, &Wear::nandWrites},
    {"nandReads", 0, &Wear::nandReads},
    {"gcWrites", 0, &Wear::hostWrites, 1, 3},
    {"bandErases", 0, &Wear::bandErases},
    {"intermediateBandErases", 0, &Wear::fastBandErases},

    {"averageTLCPECycles", 0, &Wear::cycles},
    {"averageSLCPECycles", 0, &Wear::fastCycles},
    {"maxHighEnduranceBlockErases", 0, &Wear::fastCycles, 9, 8},
    {"coldestCycle", 0, &Wear::cycles, 7, 8},
    {"avgCycle", 0, &Wear::cycles},
    {"hottestCycle", 0, &Wear::cycles, 9, 8},
    {"minSkinnyPECycles", 0, &Wear::cycles, 3, 4},
    {"averageSkinnyPECycles", 0, &Wear::cycles},
    {"maxSkinnyPECycles", 0, &Wear::cycles, 5, 4},
    {"percentUsed", 0, &Wear::cycles, 100, 1500, 100},
    {"slcPercentUsed", 0, &Wear::fastCycles, 100, 30000, 100},
};

constexpr CounterFamily kFamilies[] = {
    // Trouble is rare, whatever it befalls.
    {"Fail", counted, 0.004}, {"fail", counted, 0.004}, {"Err", counted, 0.003}, {"err", counted, 0.003},
    {"Uecc", counted, 0.005}, {"uecc", counted, 0.005}, {"UECC", counted, 0.002}, {"Unc", counted, 0.002},
    {"Abort", counted, 0.01}, {"Invalid", counted, 0.4}, {"invalid", counted, 900}, {"Mismatch", counted, 0.003},
    {"Smart", counted, 0.004}, {"Crit", counted, 0.001}, {"Blank", counted, 0.003}, {"Backward", counted, 0.002},
    {"BackWard", counted, 0.002}, {"flips", counted, 0.02}, {"Flips", counted, 4}, {"raid", counted, 0.05},
    {"Choke", counted, 0.02}, {"Extreme", counted, 0.05}, {"Throttling", counted, 0.03}, {"throttling", counted, 0.03},
    {"hard_resets", counted, 0.01}, {"regrets", counted, 0.2}, {"Kill", counted, 0.02}, {"Retire", counted, 0.004},

    // Figures that don't add up.
    {"ercent", level, 12}, {"recent", level, 12}, {"promiles", level, 620}, {"ScanPct", level, 40},
    {"min", level, 180}, {"Min", level, 180}, {"avg", level, 260}, {"Avg", level, 260},
    {"average", level, 260}, {"Ave", level, 260}, {"max", level, 900}, {"Max", level, 900},
    {"TempHist", bell, 9}, {"TmpHist", bell, 9}, {"die_temperature", bell, 60}, {"rd_window", bell, 300},
    {"Temp", level, 34}, {"Tmp", level, 34}, {"odts", level, 34}, {"SectorsCur", level, 4200},
    {"Duration", level, 45}, {"Thresh", level, 96}, {"IND_pool_free", level, 21000}, {"numFreeVirtualBlocks", level, 11},
    {"numVertics", level, 30}, {"device_config", level, 7}, {"staticSize", level, 52000}, {"validLbas", level, 2.1e7},
    {"Addr", level, 3.0e6}, {"indmbUnits", level, 60}, {"snapshotCPU", level, 1.2e6}, {"writeAmp", level, 19},

    // How often, by what is counted.
    {"_us", counted, 6e7}, {"_ms", counted, 5e7}, {"Sectors", counted, 2e5}, {"sectors", counted, 2e5},
    {"Writes", counted, 2e5}, {"Reads", counted, 3e5}, {"writes", counted, 2e5}, {"Sec", counted, 1e5},
    {"secs", counted, 1e5}, {"readStage", counted, 4e4}, {"initialRead", counted, 4e4}, {"readAlgo", counted, 900},
    {"readalgo", counted, 900}, {"passWith", counted, 5e5}, {"qos", counted, 2e4}, {"Histo", counted, 3e3},
    {"Hist", counted, 3e3}, {"hist", counted, 3e3}, {"CacheDepth", bell, 2e3}, {"Flushes", counted, 9e3},
    {"Fences", counted, 4e3}, {"Unmap", counted, 6e3}, {"unmap", counted, 6e3}, {"Erases", counted, 60},
    {"Refresh", counted, 0.3}, {"refresh", counted, 0.05}, {"Bands", counted, 20}, {"bands", counted, 20},
    {"Updates", counted, 0.02}, {"updates", counted, 0.02}, {"slcDemand", counted, 40}, {"oslc", counted, 60},
};
// clang-format on

}  // namespace

std::span<const WearCounter> wearCounterTable() { return kWearCounters; }
std::span<const CounterFamily> counterFamilyTable() { return kFamilies; }

}  // namespace mkdevice
