#include "NANDInfo/Extraction.h"

#include "NANDInfo/APIErrorMessage.h"
#include "NANDInfo/NANDInfo.h"
#include "NANDInfo/Services.h"
#include "NANDInfo/deliver/ExtractionSteps.h"
#include "platform/Eventra.h"
#include "platform/SystemLog.h"

namespace NANDInfo {

using platform::LogLevel;
using plist::Dictionary;

namespace {

constexpr std::uint32_t kMonthlyStep = 6;
constexpr std::uint32_t kLastStep = 7;  // nothing runs it

constexpr char kRunStep[] = "NANDInfo: NandInfoExtractToEV_runStep";

}  // namespace

const ExtractionStep kEV_Extraction_Step_Names[] = {
    {"FTL big view",
     [](const Services& services) {
       return createAndLogFTLStatFieldsToEventraForEvent(
           services, CopyWhitelistedNANDFTLInfo(services, false));
     }},
    {"MSP stats",
     [](const Services& services) {
       return createAndLogMSPFieldsToEventraForEvent(services,
                                                     CopyWhitelistedNANDMSPInfo(services, false));
     }},
    {"storage stats",
     [](const Services& services) {
       return createAndLogStorageStatsToEventraForEvent(
           services, CopyWhitelistedStorageStats(services, false));
     }},
    {"NVRAM stat", gatherNVRAMStats},
    {"FTL statsMag daily",
     [](const Services& services) {
       return createAndLogSMagFTLFieldsToEventraForEvent(services, 0);
     }},
    {"FTL statsMag weekly",
     [](const Services& services) {
       return createAndLogSMagFTLFieldsToEventraForEvent(services, 1);
     }},
    {"FTL statsMag monthly",
     [](const Services& services) {
       return createAndLogSMagFTLFieldsToEventraForEvent(services, 2);
     }},
    {"FTL counters", nullptr},
};

std::optional<Dictionary> NandInfoExtractToEV_runAllSteps(const Services& services,
                                                          const plist::Value* /*context*/,
                                                          std::uint32_t flags, bool wantsSummary,
                                                          std::uint64_t firstStep) {
  Dictionary summary;
  for (auto step = static_cast<std::uint32_t>(firstStep); step < kLastStep; ++step) {
    if (step == kMonthlyStep && (flags & kAllowsMonthly) == 0) {
      services.log.log(LogLevel::standard, "Skipping Stats Mag Monthly Delta");
      break;
    }
    const auto sent = NandInfoExtractToEV_runStep(services, step);
    if (wantsSummary && sent) addEntries(*sent, summary);
  }
  if (!wantsSummary) return std::nullopt;
  summary.set(kNANDInfoErrorMessageKey, GetAPIErrorMessage());
  return summary;
}

std::optional<Dictionary> NandInfoExtractToEV_runStep(const Services& services,
                                                      std::uint32_t step) {
  if (!services.eventra.offersLazySend()) {
    return Dictionary{{kNANDInfoErrorMessageKey, "Unable call EV API EventraSendEventLazy"}};
  }
  if (step >= kExtractionSteps) {
    services.log.log(LogLevel::standard, "Invalid extraction step %u", step);
    return std::nullopt;
  }
  const auto& [name, handler] = kEV_Extraction_Step_Names[step];
  services.log.log(LogLevel::standard, "%s: logging %s\n", kRunStep, name);
  if (handler == nullptr) {
    services.log.log(LogLevel::standard, "Unexpected step %s", name);
    SetAPIErrorMessage("%s: unable to log %s to EV", "NANDInfo/NANDInfo", name);
    services.log.log(LogLevel::standard, "%s: unable to log %s\n", kRunStep, name);
    return std::nullopt;
  }
  Dictionary sent = handler(services);
  services.log.log(LogLevel::standard, "%s: successfully logged %s\n", kRunStep, name);
  return sent;
}

bool EventraSendEventLazyWrapper(const Services& services, std::string_view event,
                                 platform::Eventra::PayloadProducer producer) {
  return services.eventra.EventraSendEventLazy(event, std::move(producer));
}

}  // namespace NANDInfo
