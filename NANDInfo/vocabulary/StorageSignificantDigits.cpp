// The storage statistics that may be reported, each with its significant digits.
#include "NANDInfo/vocabulary/NameRows.h"

namespace NANDInfo {

namespace {

constexpr NameRow kRows[] = {
    {"EAN_updateCount_BIC", 4},
    {"EAN_updateCount_dConfig", 4},
    {"EAN_updateCount_fConfig", 4},
    {"EAN_updateCount_FW", 4},
    {"EAN_updateCount_LowPowerEM", 4},
    {"EAN_updateCount_LTH", 4},
    {"EAN_updateCount_NonEssentialFW", 4},
    {"TLM_APIErrorCode", 4},
    {"TLM_Diskfullness_BP", 4},
    {"TLM_DQ_Diskfullness_BP", 4},
    {"TLM_SM_deltaDays", 4},
    {"EAN_imageSize_BIC", 5},
    {"EAN_imageSize_LTH", 5},
    {"TLM_averageTLCPECycles", 5},
    {"TLM_DQ_Capacity_GB", 5},
    {"TLM_formatWeeksSince2000", 5},
    {"TLM_powerOnHours", 5},
    {"TLM_powerOnSeconds", 5},
    {"TLM_averageSLCPECycles", 6},
    {"TLM_hostWrites", 8},
};

static_assert(countNames(kRows) == 20);

}  // namespace

std::span<const NameRow> storageSignificantDigitsRows() { return kRows; }

}  // namespace NANDInfo
