// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The extraction, under the names of the library's interface.

#include "NANDInfo/Extraction.h"

#include <utility>

#include "NANDInfo/APIErrorMessage.h"
#include "NANDInfo/Keys.h"
#include "NANDInfo/collect/NVRAMInfo.h"
#include "NANDInfo/deliver/Extraction.h"
#include "NANDInfo/deliver/ExtractionSteps.h"

namespace NANDInfo {

using plist::Dictionary;

std::optional<Dictionary> NandInfoExtractToEV_runAllSteps(const Services& services,
                                                          const plist::Value* /*context*/,
                                                          std::uint32_t flags, bool wantsSummary,
                                                          std::uint64_t firstStep) {
  Dictionary summary =
      runExtraction(services, static_cast<std::uint32_t>(firstStep), (flags & kAllowsMonthly) != 0);
  if (!wantsSummary) return std::nullopt;
  summary.set(kNANDInfoErrorMessageKey, GetAPIErrorMessage());
  return summary;
}

std::optional<Dictionary> NandInfoExtractToEV_runStep(const Services& services,
                                                      std::uint32_t step) {
  return runExtractionStep(services, step);
}

bool EventraSendEventLazyWrapper(const Services& services, std::string_view event,
                                 platform::Eventra::PayloadProducer producer) {
  return services.eventra.EventraSendEventLazy(event, std::move(producer));
}

Dictionary gatherNVRAMStats(const Services& services) {
  return sendNVRAMStatistics(services.eventra, nvramInfo(services));
}

Dictionary createAndLogSMagFTLFieldsToEventraForEvent(const Services& services,
                                                      std::int32_t deltaType) {
  return sendMagazine(services.log, services.eventra, services, deltaType);
}

}  // namespace NANDInfo
