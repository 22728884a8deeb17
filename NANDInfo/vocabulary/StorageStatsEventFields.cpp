// What the event of the storage statistics may carry.
#include "NANDInfo/vocabulary/NameRows.h"

namespace NANDInfo {

namespace {

constexpr NameRow kRows[] = {
    {"EAN_imageSize_BIC"},
    {"EAN_imageSize_LTH"},
    {"EAN_updateCount_BIC"},
    {"EAN_updateCount_dConfig"},
    {"EAN_updateCount_fConfig"},
    {"EAN_updateCount_FW"},
    {"EAN_updateCount_LowPowerEM"},
    {"EAN_updateCount_LTH"},
    {"EAN_updateCount_NonEssentialFW"},
    {"TLM_APIErrorCode"},
    {"TLM_averageSLCPECycles"},
    {"TLM_averageTLCPECycles"},
    {"TLM_DQ_Capacity_GB"},
    {"TLM_DQ_Diskfullness_BP"},
    {"TLM_formatWeeksSince2000"},
    {"TLM_hostWrites"},
    {"Count"},
};

static_assert(countNames(kRows) == 17);

}  // namespace

std::span<const NameRow> storageStatsEventRows() { return kRows; }

}  // namespace NANDInfo
