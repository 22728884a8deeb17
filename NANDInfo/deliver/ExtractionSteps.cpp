// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/deliver/ExtractionSteps.h"

#include <cstddef>
#include <initializer_list>
#include <iterator>
#include <string_view>
#include <utility>

#include "NANDInfo/APIErrorMessage.h"
#include "NANDInfo/Events.h"
#include "NANDInfo/Keys.h"
#include "NANDInfo/Magazine.h"
#include "NANDInfo/Utilities.h"
#include "NANDInfo/Whitelists.h"
#include "NANDInfo/collect/MagazineInfo.h"
#include "NANDInfo/deliver/EventSender.h"
#include "platform/SystemLog.h"

namespace NANDInfo {

using plist::Dictionary;
using plist::Number;
using plist::Value;

namespace {

Dictionary failure(const char* message) { return {{kNANDInfoErrorMessageKey, message}}; }

// What an event may carry of the fields.
Dictionary fieldsFor(const char* event, Dictionary fields) {
  return CreateFilteredDict(std::move(fields), EventraConfigDetails(event));
}

Dictionary mspFields(std::string_view index, const Value& counters, std::size_t count) {
  const auto* all = counters.as<Dictionary>();
  Dictionary fields = fieldsFor(kEventName_massStorage_NANDInfo_MSPCounters_1,
                                all != nullptr ? *all : Dictionary());
  fields.set(kTLM_MSP_msp_index, index);
  fields.set(kTLM_MSP_total_nof_msps, std::uint64_t{count});
  return fields;
}

struct Event {
  const char *name, *view;
};

Dictionary sendEach(const EventSender& sender, std::initializer_list<Event> events,
                    const Dictionary& statistics) {
  Dictionary sent;
  for (const auto& [event, view] : events) {
    sender.announce(event);
    const Payload payload = makePayload(fieldsFor(event, statistics));
    if (sender.send(event, view, payload)) addEntries(*payload, sent);
  }
  return sent;
}

}  // namespace

Dictionary sendFTLStatistics(platform::SystemLog& log, platform::Eventra& eventra,
                             const Dictionary& ftl) {
  return sendEach(EventSender(log, eventra, "createAndLogFTLStatFieldsToEventraForEvent"),
                  {{kEventName_massStorage_NANDInfo_FTLCounters_1,
                    kViewName_massStorage_NANDInfo_FTLCounters_1},
                   {kEventName_massStorage_NANDInfo_FTLHistograms_1,
                    kViewName_massStorage_NANDInfo_FTLHistograms_1},
                   {kEventName_massStorage_NANDInfo_FTLHistograms_2,
                    kViewName_massStorage_NANDInfo_FTLHistograms_2}},
                  ftl);
}

Dictionary sendStorageStats(platform::SystemLog& log, platform::Eventra& eventra,
                            const Dictionary& storage) {
  return sendEach(EventSender(log, eventra, "createAndLogStorageStatsToEventraForEvent"),
                  {{kEventName_massStorage_NANDInfo_StorageStats_1,
                    kViewName_massStorage_NANDInfo_StorageStats_1}},
                  storage);
}

Dictionary sendMSPStatistics(platform::SystemLog& log, platform::Eventra& eventra,
                             Dictionary msps) {
  constexpr const char* kEvent = kEventName_massStorage_NANDInfo_MSPCounters_1;
  constexpr char kFunction[] = "createAndLogMSPFieldsToEventraForEvent";
  msps.remove(kTLM_APIErrorMessage);
  const EventSender sender(log, eventra, kFunction);
  sender.announce(kEvent);
  Dictionary sent;
  for (const auto& [index, counters] : msps) {
    const Payload payload = makePayload(mspFields(index, counters, msps.size()));
    if (sender.send(kEvent, kViewName_massStorage_NANDInfo_MSPCounters_1, payload)) {
      sent.set(kTLM_MSP_msp_index, *payload);
    } else {
      SetAPIErrorMessage("%s: EventraSendEventLazy failed to log to EV", kFunction);
    }
  }
  log.log(platform::LogLevel::standard, "NANDInfo: %s: %s completed (total_nof_msps:%zu)\n",
          kFunction, kEvent, msps.size());
  return sent;
}

Dictionary sendNVRAMStatistics(platform::Eventra& eventra, Dictionary statistics) {
  if (!statistics.empty()) {
    sendEvent(eventra, kEventName_massStorage_NANDInfo_NORWrites, makePayload(statistics));
  }
  return statistics;
}

Dictionary sendMagazine(platform::SystemLog& log, platform::Eventra& eventra,
                        const CollectServices& services, std::int32_t deltaType) {
  static constexpr struct {
    const char* event;
    std::uint64_t hours;
    bool addsHistory;
  } kWindows[] = {{kEventName_massStorage_NANDInfo_SM_Daily_FTLCounters_1, 24, true},
                  {kEventName_massStorage_NANDInfo_SM_WeeklyMA_FTLCounters_1, 168, false},
                  {kEventName_massStorage_NANDInfo_SM_Monthly_FTLCounters_1, 720, false}};
  if (deltaType < 0 || static_cast<std::size_t>(deltaType) >= std::size(kWindows)) {
    log.log(platform::LogLevel::standard, "Unexpected SM delta type %d", deltaType);
    return failure("Wrong SM delta type");
  }
  const auto& [event, hours, addsHistory] = kWindows[deltaType];
  Dictionary window = magazineInfo(services, hours, true, kMagazineBoth);
  const Number* const supported = window.number(kNANDInfoIsStatMagSupported);
  if (supported == nullptr || !supported->boolValue()) {
    return failure("Stats Magazine not supported");
  }

  const EventSender sender(log, eventra, "createAndLogSMagFTLFieldsToEventraForEvent");
  sender.announce(event);
  window = fieldsFor(event, std::move(window));
  if (addsHistory) addEntries(magazineHistory(services.controller, false), window);
  const Payload payload = makePayload(std::move(window));
  return sender.send(event, event, payload) ? *payload : Dictionary();
}

}  // namespace NANDInfo
