#include "NANDInfo/deliver/ExtractionSteps.h"

#include <initializer_list>
#include <iterator>
#include <memory>
#include <utility>

#include "NANDInfo/APIErrorMessage.h"
#include "NANDInfo/Events.h"
#include "NANDInfo/Extraction.h"
#include "NANDInfo/Keys.h"
#include "NANDInfo/Magazine.h"
#include "NANDInfo/Services.h"
#include "NANDInfo/Utilities.h"
#include "NANDInfo/Whitelists.h"
#include "NANDInfo/controller/DriverHandles.h"
#include "platform/DeviceRegistry.h"
#include "platform/Eventra.h"
#include "platform/SystemLog.h"

namespace NANDInfo {

using platform::LogLevel;
using plist::Dictionary;
using plist::Number;

namespace {

// A payload that the sink may still read while the step goes on.
using Payload = std::shared_ptr<const Dictionary>;

bool send(const Services& services, const char* event, Payload payload) {
  return EventraSendEventLazyWrapper(services, event,
                                     [payload = std::move(payload)] { return *payload; });
}

Dictionary failure(const char* message) { return {{kNANDInfoErrorMessageKey, message}}; }

// The lines of one step, which begin with the name of the function that sends.
class StepLog {
 public:
  StepLog(const Services& services, const char* function)
      : services_(services), function_(function) {}

  void enabled(const char* event) const {
    services_.log.log(LogLevel::standard, "NANDInfo: %s: %s enabled=%d\n", function_, event,
                      services_.eventra.EventraIsEventUsed(event) ? 1 : 0);
  }
  void outcome(bool sent, const char* what) const {
    services_.log.log(LogLevel::standard,
                      sent ? "NANDInfo: %s: SUCCESS in logging %s using EventraSendEventLazy\n"
                           : "NANDInfo: %s: FAILED to log %s using EventraSendEventLazy\n",
                      function_, what);
  }

 private:
  const Services services_;
  const char* function_;
};

struct Event {
  const char *name, *view;
};

Dictionary sendStatistics(const Services& services, const char* function,
                          const Dictionary& statistics, std::initializer_list<Event> events) {
  const StepLog log(services, function);
  Dictionary sent;
  for (const auto& [event, view] : events) {
    log.enabled(event);
    const auto payload = std::make_shared<const Dictionary>(
        CreateFilteredDict(statistics, EventraConfigDetails(event)));
    const bool succeeds = send(services, event, payload);
    log.outcome(succeeds, view);
    if (succeeds) addEntries(*payload, sent);
  }
  return sent;
}

}  // namespace

Dictionary createAndLogFTLStatFieldsToEventraForEvent(const Services& services,
                                                      const std::optional<Dictionary>& ftl) {
  if (!ftl) return failure("Unable gather FTL fields to log to EV");
  return sendStatistics(services, "createAndLogFTLStatFieldsToEventraForEvent", *ftl,
                        {{kEventName_massStorage_NANDInfo_FTLCounters_1,
                          kViewName_massStorage_NANDInfo_FTLCounters_1},
                         {kEventName_massStorage_NANDInfo_FTLHistograms_1,
                          kViewName_massStorage_NANDInfo_FTLHistograms_1},
                         {kEventName_massStorage_NANDInfo_FTLHistograms_2,
                          kViewName_massStorage_NANDInfo_FTLHistograms_2}});
}

Dictionary createAndLogMSPFieldsToEventraForEvent(const Services& services,
                                                  std::optional<Dictionary> msps) {
  constexpr const char* kEvent = kEventName_massStorage_NANDInfo_MSPCounters_1;
  constexpr char kFunction[] = "createAndLogMSPFieldsToEventraForEvent";
  if (!msps) return failure("Unable gather MSP fields to log to EV");
  msps->remove(kTLM_APIErrorMessage);
  const std::size_t count = msps->size();

  const StepLog log(services, kFunction);
  log.enabled(kEvent);
  Dictionary sent;
  for (const auto& [index, value] : *msps) {
    const Dictionary* const counters = value.as<Dictionary>();
    Dictionary fields = counters != nullptr
                            ? CreateFilteredDict(*counters, EventraConfigDetails(kEvent))
                            : Dictionary();
    fields.set(kTLM_MSP_msp_index, index);
    fields.set(kTLM_MSP_total_nof_msps, std::uint64_t{count});
    const auto payload = std::make_shared<const Dictionary>(std::move(fields));
    const bool succeeds = send(services, kEvent, payload);
    log.outcome(succeeds, kViewName_massStorage_NANDInfo_MSPCounters_1);
    if (succeeds) {
      sent.set(kTLM_MSP_msp_index, *payload);
    } else {
      SetAPIErrorMessage("%s: EventraSendEventLazy failed to log to EV", kFunction);
    }
  }
  services.log.log(LogLevel::standard, "NANDInfo: %s: %s completed (total_nof_msps:%zu)\n",
                   kFunction, kEvent, count);
  return sent;
}

Dictionary createAndLogStorageStatsToEventraForEvent(const Services& services,
                                                     const std::optional<Dictionary>& storage) {
  if (!storage) return failure("Unable gather Storage fields to log to EV");
  return sendStatistics(services, "createAndLogStorageStatsToEventraForEvent", *storage,
                        {{kEventName_massStorage_NANDInfo_StorageStats_1,
                          kViewName_massStorage_NANDInfo_StorageStats_1}});
}

Dictionary gatherNVRAMStats(const Services& services) {
  static constexpr struct {
    const char *property, *field;
  } kProperties[] = {{"CommonUsed", "commonused"},
                     {"SystemUsed", "systemused"},
                     {"Generation", "norwrites"},
                     {"Version", "version"}};
  const RegistryHandle service(services,
                               services.registry.DrvGetMatchingService("NvramDiagService"));
  if (service.get() == 0) return {};
  Dictionary statistics;
  for (const auto& [property, field] : kProperties) {
    auto value = services.registry.searchProperty(service.get(), property,
                                                  platform::DeviceRegistry::Direction::children);
    if (value) statistics.set(field, *std::move(value));
  }
  if (!statistics.empty()) {
    send(services, kEventName_massStorage_NANDInfo_NORWrites,
         std::make_shared<const Dictionary>(statistics));
  }
  return statistics;
}

Dictionary createAndLogSMagFTLFieldsToEventraForEvent(const Services& services,
                                                      std::int32_t deltaType) {
  static constexpr struct {
    const char* event;
    std::uint64_t hours;
    bool addsHistory;
  } kWindows[] = {{kEventName_massStorage_NANDInfo_SM_Daily_FTLCounters_1, 24, true},
                  {kEventName_massStorage_NANDInfo_SM_WeeklyMA_FTLCounters_1, 168, false},
                  {kEventName_massStorage_NANDInfo_SM_Monthly_FTLCounters_1, 720, false}};
  if (deltaType < 0 || static_cast<std::size_t>(deltaType) >= std::size(kWindows)) {
    services.log.log(LogLevel::standard, "Unexpected SM delta type %d", deltaType);
    return failure("Wrong SM delta type");
  }
  const auto& [event, hours, addsHistory] = kWindows[deltaType];
  Dictionary window = CopySMagNANDFTLInfo(services, hours, 1, kMagazineBoth);
  const Number* const supported = window.number(kNANDInfoIsStatMagSupported);
  if (supported == nullptr || !supported->boolValue()) {
    return failure("Stats Magazine not supported");
  }

  const StepLog log(services, "createAndLogSMagFTLFieldsToEventraForEvent");
  log.enabled(event);
  window = CreateFilteredDict(std::move(window), EventraConfigDetails(event));
  if (addsHistory) addEntries(CopySMagNANDFTLCustomHistoryInfo(services, 0), window);
  const auto payload = std::make_shared<const Dictionary>(std::move(window));
  const bool succeeds = send(services, event, payload);
  log.outcome(succeeds, event);
  return succeeds ? *payload : Dictionary();
}

}  // namespace NANDInfo
