// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/Events.h"

#include <algorithm>
#include <iterator>

#include "NANDInfo/vocabulary/CounterLists.h"

namespace NANDInfo {

namespace {

constexpr EventView kEvents[] = {
    {kEventName_massStorage_NANDInfo_FTLCounters_1, kViewName_massStorage_NANDInfo_FTLCounters_1,
     tableOf<kCounters>},
    {kEventName_massStorage_NANDInfo_FTLHistograms_1,
     kViewName_massStorage_NANDInfo_FTLHistograms_1, tableOf<kHistograms>},
    {kEventName_massStorage_NANDInfo_FTLHistograms_2,
     kViewName_massStorage_NANDInfo_FTLHistograms_2, tableOf<kHistograms2>},
    {kEventName_massStorage_NANDInfo_SM_Daily_FTLCounters_1,
     kViewName_massStorage_NANDInfo_SM_Daily_FTLCounters_1, tableOf<kDaily>},
    {kEventName_massStorage_NANDInfo_SM_WeeklyMA_FTLCounters_1,
     kViewName_massStorage_NANDInfo_SM_WeeklyMA_FTLCounters_1, tableOf<kLonger>},
    {kEventName_massStorage_NANDInfo_SM_Monthly_FTLCounters_1,
     kViewName_massStorage_NANDInfo_SM_Monthly_FTLCounters_1, tableOf<kLonger>},
    {kEventName_massStorage_NANDInfo_MSPCounters_1, kViewName_massStorage_NANDInfo_MSPCounters_1,
     tableOf<kMSPEvent>},
    {kEventName_massStorage_NANDInfo_StorageStats_1, kViewName_massStorage_NANDInfo_StorageStats_1,
     tableOf<kStorageEvent>},
};

}  // namespace

std::span<const EventView> eventViews() { return kEvents; }

const NameTable* EventraConfigDetails(std::string_view event) {
  const auto found = std::ranges::find(kEvents, event, &EventView::event);
  return found != std::end(kEvents) ? &found->fields() : nullptr;
}

}  // namespace NANDInfo
