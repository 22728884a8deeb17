#include "NANDInfo/Extraction.h"

#include "NANDInfo/APIErrorMessage.h"
#include "NANDInfo/NANDInfo.h"
#include "NANDInfo/deliver/ExtractionSteps.h"
#include "platform/Platform.h"

namespace NANDInfo {

using platform::LogLevel;
using platform::Platform;
using plist::Dictionary;

namespace {

constexpr std::uint32_t kMonthlyStep = 6;
constexpr std::uint32_t kLastStep = 7;  // nothing runs it

constexpr char kRunStep[] = "NANDInfo: NandInfoExtractToEV_runStep";

}  // namespace

const ExtractionStep kEV_Extraction_Step_Names[] = {
    {"FTL big view",
     [](Platform& platform) {
       return createAndLogFTLStatFieldsToEventraForEvent(
           platform, CopyWhitelistedNANDFTLInfo(platform, false));
     }},
    {"MSP stats",
     [](Platform& platform) {
       return createAndLogMSPFieldsToEventraForEvent(platform,
                                                     CopyWhitelistedNANDMSPInfo(platform, false));
     }},
    {"storage stats",
     [](Platform& platform) {
       return createAndLogStorageStatsToEventraForEvent(
           platform, CopyWhitelistedStorageStats(platform, false));
     }},
    {"NVRAM stat", gatherNVRAMStats},
    {"FTL statsMag daily",
     [](Platform& platform) { return createAndLogSMagFTLFieldsToEventraForEvent(platform, 0); }},
    {"FTL statsMag weekly",
     [](Platform& platform) { return createAndLogSMagFTLFieldsToEventraForEvent(platform, 1); }},
    {"FTL statsMag monthly",
     [](Platform& platform) { return createAndLogSMagFTLFieldsToEventraForEvent(platform, 2); }},
    {"FTL counters", nullptr},
};

std::optional<Dictionary> NandInfoExtractToEV_runAllSteps(Platform& platform,
                                                          const plist::Value* /*context*/,
                                                          std::uint32_t flags, bool wantsSummary,
                                                          std::uint64_t firstStep) {
  Dictionary summary;
  for (auto step = static_cast<std::uint32_t>(firstStep); step < kLastStep; ++step) {
    if (step == kMonthlyStep && (flags & kAllowsMonthly) == 0) {
      platform.log.log(LogLevel::standard, "Skipping Stats Mag Monthly Delta");
      break;
    }
    const auto sent = NandInfoExtractToEV_runStep(platform, step);
    if (wantsSummary && sent) addEntries(*sent, summary);
  }
  if (!wantsSummary) return std::nullopt;
  summary.set(kNANDInfoErrorMessageKey, GetAPIErrorMessage());
  return summary;
}

std::optional<Dictionary> NandInfoExtractToEV_runStep(Platform& platform, std::uint32_t step) {
  if (!platform.eventra.offersLazySend()) {
    return Dictionary{{kNANDInfoErrorMessageKey, "Unable call EV API EventraSendEventLazy"}};
  }
  if (step >= kExtractionSteps) {
    platform.log.log(LogLevel::standard, "Invalid extraction step %u", step);
    return std::nullopt;
  }
  const auto& [name, handler] = kEV_Extraction_Step_Names[step];
  platform.log.log(LogLevel::standard, "%s: logging %s\n", kRunStep, name);
  if (handler == nullptr) {
    platform.log.log(LogLevel::standard, "Unexpected step %s", name);
    SetAPIErrorMessage("%s: unable to log %s to EV", "NANDInfo/NANDInfo", name);
    platform.log.log(LogLevel::standard, "%s: unable to log %s\n", kRunStep, name);
    return std::nullopt;
  }
  Dictionary sent = handler(platform);
  platform.log.log(LogLevel::standard, "%s: successfully logged %s\n", kRunStep, name);
  return sent;
}

bool EventraSendEventLazyWrapper(Platform& platform, std::string_view event,
                                 platform::Eventra::PayloadProducer producer) {
  return platform.eventra.EventraSendEventLazy(event, std::move(producer));
}

}  // namespace NANDInfo
