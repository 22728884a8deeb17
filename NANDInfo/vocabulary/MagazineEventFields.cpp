// What the events of the stats magazine may carry: the daily one, and the weekly and the monthly
// one, which are alike.
#include "NANDInfo/vocabulary/NameRows.h"

namespace NANDInfo {

namespace {

constexpr NameRow kDaily[] = {
    {"averageSLCPECycles"},
    {"averageTLCPECycles"},
    {"directToTLCSectors"},
    {"E2EDPErrorCounters_{0..11}"},
    {"fallbackToWaterfall"},
    {"flushNwToSlc"},
    {"flushNwToTlc"},
    {"gcWrites"},
    {"hostReads"},
    {"hostWrites"},
    {"lockToTlc"},
    {"nandReads"},
    {"nandWrites"},
    {"numDieFailures"},
    {"numEfail"},
    {"numFences"},
    {"numFlushes"},
    {"numGrownBad"},
    {"numPfail"},
    {"oslcHw"},
    {"powerOnHours"},
    {"raidFailedLbaMismatch"},
    {"raidFailedReconstructionHost"},
    {"raidFailedReconstructionInternal"},
    {"raidFailSectors"},
    {"raidParityInvalid"},
    {"raidSmartErrors"},
    {"slcGCInvalidations"},
    {"slcInvalidations"},
    {"TLM_Capacity_GB"},
    {"TLM_Diskfullness_BP"},
    {"TLM_instantaneous_gc_wamp_{0..5}"},
    {"TLM_SM_deltaDays"},
    {"ueccReads"},
    {"uncleanBoots"},
    {"Count"},
};

static_assert(countNames(kDaily) == 52);

constexpr NameRow kLonger[] = {
    {"averageSLCPECycles"},
    {"averageTLCPECycles"},
    {"directToTLCSectors"},
    {"fallbackToWaterfall"},
    {"flushNwToSlc"},
    {"flushNwToTlc"},
    {"gcWrites"},
    {"hostReads"},
    {"hostWrites"},
    {"lockToTlc"},
    {"nandReads"},
    {"nandWrites"},
    {"numDieFailures"},
    {"numEfail"},
    {"numFences"},
    {"numFlushes"},
    {"numGrownBad"},
    {"numPfail"},
    {"oslcHw"},
    {"powerOnHours"},
    {"raidFailedLbaMismatch"},
    {"raidFailedReconstructionHost"},
    {"raidFailedReconstructionInternal"},
    {"raidFailSectors"},
    {"raidParityInvalid"},
    {"slcGCInvalidations"},
    {"slcInvalidations"},
    {"TLM_Capacity_GB"},
    {"TLM_Diskfullness_BP"},
    {"TLM_SM_deltaDays"},
    {"ueccReads"},
    {"uncleanBoots"},
    {"Count"},
};

static_assert(countNames(kLonger) == 33);

}  // namespace

std::span<const NameRow> magazineDailyEventRows() { return kDaily; }
std::span<const NameRow> magazineLongerEventRows() { return kLonger; }

}  // namespace NANDInfo
