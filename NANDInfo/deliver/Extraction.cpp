// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/deliver/Extraction.h"

#include "NANDInfo/APIErrorMessage.h"
#include "NANDInfo/Keys.h"
#include "NANDInfo/Utilities.h"
#include "NANDInfo/collect/FTLInfo.h"
#include "NANDInfo/collect/MSPInfo.h"
#include "NANDInfo/collect/NVRAMInfo.h"
#include "NANDInfo/collect/StorageStats.h"
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
       return sendFTLStatistics(services.log, services.eventra,
                                whitelistedFTLInfo(services, false));
     }},
    {"MSP stats",
     [](const Services& services) {
       return sendMSPStatistics(services.log, services.eventra,
                                whitelistedMSPInfo(services, false));
     }},
    {"storage stats",
     [](const Services& services) {
       return sendStorageStats(services.log, services.eventra, storageStats(services, false));
     }},
    {"NVRAM stat",
     [](const Services& services) {
       return sendNVRAMStatistics(services.eventra, nvramInfo(services));
     }},
    {"FTL statsMag daily",
     [](const Services& services) {
       return sendMagazine(services.log, services.eventra, services, 0);
     }},
    {"FTL statsMag weekly",
     [](const Services& services) {
       return sendMagazine(services.log, services.eventra, services, 1);
     }},
    {"FTL statsMag monthly",
     [](const Services& services) {
       return sendMagazine(services.log, services.eventra, services, 2);
     }},
    {"FTL counters", nullptr},
};

std::optional<Dictionary> runExtractionStep(const Services& services, std::uint32_t step) {
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

Dictionary runExtraction(const Services& services, std::uint32_t firstStep, bool allowsMonthly) {
  Dictionary all;
  for (std::uint32_t step = firstStep; step < kLastStep; ++step) {
    if (step == kMonthlyStep && !allowsMonthly) {
      services.log.log(LogLevel::standard, "Skipping Stats Mag Monthly Delta");
      break;
    }
    if (const auto sent = runExtractionStep(services, step)) addEntries(*sent, all);
  }
  return all;
}

}  // namespace NANDInfo
