// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The analytics events of the storage library.
//
// An event is sent under its event name; the view name is what the sink's configuration calls it.
#pragma once

#include <span>
#include <string_view>

#include "NANDInfo/NameTable.h"
#include "base/Exported.h"

namespace MORVEND_EXPORTED NANDInfo {

// The names under which events leave; "SM" ones hold what a window of the magazine adds up to.
inline constexpr char kEventName_massStorage_NANDInfo_FTLCounters_1[] =
    "com.norba.massStorage.NANDInfo.FTLCounters_1";
inline constexpr char kEventName_massStorage_NANDInfo_FTLHistograms_1[] =
    "com.norba.massStorage.NANDInfo.FTLHistograms_1";
inline constexpr char kEventName_massStorage_NANDInfo_FTLHistograms_2[] =
    "com.norba.massStorage.NANDInfo.FTLHistograms_2";
inline constexpr char kEventName_massStorage_NANDInfo_SM_Daily_FTLCounters_1[] =
    "com.norba.massStorage.NANDInfo.SM.Daily.FTLCounters_1";
inline constexpr char kEventName_massStorage_NANDInfo_SM_WeeklyMA_FTLCounters_1[] =
    "com.norba.massStorage.NANDInfo.SM.WeeklyMA.FTLCounters_1";
inline constexpr char kEventName_massStorage_NANDInfo_SM_Monthly_FTLCounters_1[] =
    "com.norba.massStorage.NANDInfo.SM.Monthly.FTLCounters_1";
inline constexpr char kEventName_massStorage_NANDInfo_MSPCounters_1[] =
    "com.norba.massStorage.NANDInfo.MSPCounters_1";
inline constexpr char kEventName_massStorage_NANDInfo_StorageStats_1[] =
    "com.norba.massStorage.NANDInfo.StorageStats_1";

// It has no view, and carries everything that it is given.
inline constexpr char kEventName_massStorage_NANDInfo_NORWrites[] =
    "com.norba.massStorage.NANDInfo.NORWrites";

inline constexpr char kViewName_massStorage_NANDInfo_FTLCounters_1[] =
    "massStorage_NANDInfo_FTLCounters_1";
inline constexpr char kViewName_massStorage_NANDInfo_FTLHistograms_1[] =
    "massStorage_NANDInfo_FTLHistograms_1";
inline constexpr char kViewName_massStorage_NANDInfo_FTLHistograms_2[] =
    "massStorage_NANDInfo_FTLHistograms_2";
inline constexpr char kViewName_massStorage_NANDInfo_SM_Daily_FTLCounters_1[] =
    "massStorage_NANDInfo_SM_Daily_FTLCounters_1";
inline constexpr char kViewName_massStorage_NANDInfo_SM_WeeklyMA_FTLCounters_1[] =
    "massStorage_NANDInfo_SM_WeeklyMA_FTLCounters_1";
inline constexpr char kViewName_massStorage_NANDInfo_SM_Monthly_FTLCounters_1[] =
    "massStorage_NANDInfo_SM_Monthly_FTLCounters_1";
inline constexpr char kViewName_massStorage_NANDInfo_MSPCounters_1[] =
    "massStorage_NANDInfo_MSPCounters_1";
inline constexpr char kViewName_massStorage_NANDInfo_StorageStats_1[] =
    "massStorage_NANDInfo_StorageStats_1";

// The events with a view, and the fields that each may carry.
struct EventView {
  std::string_view event, view;
  const NameTable& (*fields)();
};
std::span<const EventView> eventViews();

// The fields that an event may carry, expanded at the first use; null for an event that has
// no view. What else a dictionary holds stays on the device.
const NameTable* EventraConfigDetails(std::string_view event);

}  // namespace NANDInfo
