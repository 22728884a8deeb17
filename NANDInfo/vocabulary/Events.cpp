#include "NANDInfo/Events.h"

#include <algorithm>
#include <iterator>

#include "NANDInfo/vocabulary/NameRows.h"

namespace NANDInfo {

namespace {

template <std::span<const NameRow> (*rows)()>
const NameTable& expanded() {
  static const NameTable table(rows());
  return table;
}

struct EventConfig {
  std::string_view event;
  const NameTable& (*fields)();
};

constexpr EventConfig kEvents[] = {
    {kEventName_massStorage_NANDInfo_FTLCounters_1, expanded<ftlCountersEventRows>},
    {kEventName_massStorage_NANDInfo_FTLHistograms_1, expanded<ftlHistograms1EventRows>},
    {kEventName_massStorage_NANDInfo_FTLHistograms_2, expanded<ftlHistograms2EventRows>},
    {kEventName_massStorage_NANDInfo_SM_Daily_FTLCounters_1, expanded<magazineDailyEventRows>},
    {kEventName_massStorage_NANDInfo_SM_WeeklyMA_FTLCounters_1, expanded<magazineLongerEventRows>},
    {kEventName_massStorage_NANDInfo_SM_Monthly_FTLCounters_1, expanded<magazineLongerEventRows>},
    {kEventName_massStorage_NANDInfo_MSPCounters_1, expanded<mspCountersEventRows>},
    {kEventName_massStorage_NANDInfo_StorageStats_1, expanded<storageStatsEventRows>},
};

}  // namespace

const NameTable* EventraConfigDetails(std::string_view event) {
  const auto found = std::ranges::find(kEvents, event, &EventConfig::event);
  return found != std::end(kEvents) ? &found->fields() : nullptr;
}

}  // namespace NANDInfo
