// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The extraction: storage health as events of the analytics sink, one step after another. Steps are
// independent: what fails in one is logged, and the next one runs.
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string_view>

#include "NANDInfo/Services.h"
#include "base/Exported.h"
#include "platform/Eventra.h"
#include "plist/Value.h"

namespace MORVEND_EXPORTED NANDInfo {

// A step's number is its place in the table.
struct ExtractionStep {
  const char* name;
  plist::Dictionary (*handler)(const Services& services);  // null: there is none
};
inline constexpr std::size_t kExtractionSteps = 8;
extern const ExtractionStep kEV_Extraction_Step_Names[kExtractionSteps];

// A flag of NandInfoExtractToEV_runAllSteps: the monthly step may run.
inline constexpr std::uint32_t kAllowsMonthly = 1;

// Runs the steps from the first one (the low 32 bits; below 7) on; the monthly one, which is the
// last, only when the flags allow it. `context` is not consulted. The summary, if wanted, is what
// the steps sent (of equal keys the later), with the error message of the process under
// "com.norba.NANDInfo.ErrorMessage".
std::optional<plist::Dictionary> NandInfoExtractToEV_runAllSteps(const Services& services,
                                                                 const plist::Value* context,
                                                                 std::uint32_t flags,
                                                                 bool wantsSummary,
                                                                 std::uint64_t firstStep);

// Runs one step; none when there is no such step. Without a lazy send on this device, or without
// anything to send, the result holds an error message.
std::optional<plist::Dictionary> NandInfoExtractToEV_runStep(const Services& services,
                                                             std::uint32_t step);

// Sends an event; the sink's answer. The sink keeps the producer until it is done with it, and may
// call it later and on its own thread.
bool EventraSendEventLazyWrapper(const Services& services, std::string_view event,
                                 platform::Eventra::PayloadProducer producer);

// Sends how full the boot variables' memory is and how often it was written; the result is what
// there was to send, empty without that memory's service.
plist::Dictionary gatherNVRAMStats(const Services& services);

// Sends the stats magazine's counters of the last day (0), week (1) or month (2), and returns what
// was sent: nothing if the send failed; an error message for another type or without a magazine.
plist::Dictionary createAndLogSMagFTLFieldsToEventraForEvent(const Services& services,
                                                             std::int32_t deltaType);

}  // namespace NANDInfo
