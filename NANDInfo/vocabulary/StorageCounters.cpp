// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The counters that no buffer holds under a key of their own: name, significant digits, where it
// goes.
#include <algorithm>

#include "NANDInfo/vocabulary/CounterRows.h"

namespace NANDInfo {

namespace {

constexpr std::uint16_t kDerived = kFTL | kMagazine;
constexpr std::uint16_t kWithAll =
    kDerived | kMSP | kStorage | kAlong | kHistograms | kHistograms2 | kMSPEvent | kStorageEvent;
constexpr std::uint16_t kEveryEvent =
    kCounters | kHistograms | kHistograms2 | kMSPEvent | kStorageEvent | kWindows;

// clang-format off
constexpr NamedCounter kRows[] = {
    // The storage statistics of their own.
    {"EAN_imageSize_BIC",                  5, kStorage | kStorageEvent},
    {"EAN_imageSize_LTH",                  5, kStorage | kStorageEvent},
    {"EAN_updateCount_BIC",                4, kStorage | kStorageEvent},
    {"EAN_updateCount_FW",                 4, kStorage | kStorageEvent},
    {"EAN_updateCount_LTH",                4, kStorage | kStorageEvent},
    {"EAN_updateCount_LowPowerEM",         4, kStorage | kStorageEvent},
    {"EAN_updateCount_NonEssentialFW",     4, kStorage | kStorageEvent},
    {"EAN_updateCount_dConfig",            4, kStorage | kStorageEvent},
    {"EAN_updateCount_fConfig",            4, kStorage | kStorageEvent},

    // The derived fields; first those that go with the MSP and storage statistics, in order.
    {"TLM_APIErrorMessage",                0, kDerived | kMSP | kAlong},
    {"TLM_APIErrorCode",                   4, kWithAll | kCounters},
    {"TLM_DQ_Diskfullness_BP",             4, kDerived | kStorage | kAlong | kCounters | kHistograms2 | kStorageEvent},
    {"TLM_DQ_Capacity_GB",                 5, kWithAll | kCounters},
    {"TLM_averageTLCPECycles",             5, kWithAll},
    {"TLM_averageSLCPECycles",             6, kWithAll},
    {"TLM_hostWrites",                     8, kWithAll},
    {"TLM_formatWeeksSince2000",           5, kWithAll | kCounters},
    {"TLM_Spacereap_totalPurgeable",       5, kDerived | kAlong | kCounters},
    {"TLM_Spacereap_totalNonPurgeable",    5, kDerived | kAlong | kCounters},
    {"TLM_mspBootBlockReadFails_main",     5, kDerived | kAlong | kCounters},
    {"TLM_mspBootBlockReadFails_backup",   5, kDerived | kAlong | kCounters},
    {"TLM_mspBootBlockProgFails_main",     5, kDerived | kAlong | kCounters},
    {"TLM_mspBootBlockProgFails_backup",   5, kDerived | kAlong | kCounters},
    {"TLM_mspBootBlockEraseFails_main",    5, kDerived | kAlong | kCounters},
    {"TLM_mspBootBlockEraseFails_backup",  5, kDerived | kAlong | kCounters},
    {"TLM_numBootBlockRefreshes_max",      5, kDerived | kAlong | kCounters},
    {"TLM_DQ_AmountDataAvailable_MB",      5, kDerived | kAlong | kCounters},
    {"TLM_Capacity_GB",                    5, kDerived | kAlong | kWindows},
    {"TLM_Diskfullness_BP",                4, kDerived | kStorage | kAlong | kWindows},
    {"TLM_SM_deltaDays",                   4, kDerived | kStorage | kAlong | kWindows},
    {"TLM_UserCapacity_MB",                4, kDerived | kAlong},
    {"TLM_powerOnHours",                   5, kDerived | kMSP | kStorage | kAlong},
    {"TLM_powerOnSeconds",                 5, kDerived | kMSP | kStorage | kAlong},
    {"TLM_instantaneous_gc_wamp_{0..5}",   5, kDerived | kAlong | kDaily},
    {"TLM_intermediatePartitionSize",      5, kDerived | kCounters},
    {"TLM_VMFreezer_bytesWritten",         5, kDerived | kCounters},
    {"TLM_storeDemoMode",                  1, kDerived | kCounters},
    {"TLM_instantaneous_gc_wamp{0..5}",    5, kMSP},

    // Elements that go elsewhere than the rest of their arrays.
    {"dmReasonsSlc_{4, 6}",                kNoDigits, kHistograms},
    {"dmReasonsTlc_{4, 6}",                kNoDigits, kHistograms},
    {"wcacheWaitLogMs_{0..2, 4..9}",       kNoDigits, kHistograms},

    // Names in events only.
    {"cpuBurstLength{0..7}",               kNoDigits, kHistograms},
    {"dmReasonsSlc{0..18}",                kNoDigits, kHistograms},
    {"dmReasonsTlc{0..18}",                kNoDigits, kHistograms},
    {"gcSearchPortion{0..15}",             kNoDigits, kHistograms},
    {"gcSearchTimeHistory{0..9}",          kNoDigits, kHistograms},
    {"fw_version_identifier_{0..3}",       kNoDigits, kMSPEvent},
    {"msp_index",                          kNoDigits, kMSPEvent},
    {"total_nof_msps",                     kNoDigits, kMSPEvent},
    {"Count",                              kNoDigits, kEveryEvent},
};
// clang-format on

static_assert(areUnique(kRows, &NamedCounter::family));
static_assert(std::ranges::all_of(kRows, [](const NamedCounter& row) {
  constexpr std::uint16_t kRounding = kFTL | kMSP | kStorage | kMagazine;
  return (row.digits != kNoDigits) == ((row.lists & kRounding) != 0);
}));

}  // namespace

std::span<const NamedCounter> storageCounters() { return kRows; }

}  // namespace NANDInfo
