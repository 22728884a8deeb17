// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/collect/HealthInfo.h"

#include <algorithm>
#include <cstdint>
#include <span>
#include <utility>

#include "NANDInfo/APIErrorMessage.h"
#include "NANDInfo/Keys.h"
#include "NANDInfo/Whitelists.h"
#include "NANDInfo/collect/FTLStatistics.h"
#include "NANDInfo/decode/Counters.h"

namespace NANDInfo {

using plist::Dictionary;

namespace {

constexpr NameRow kServitaFigures[] = {{kNANDHealthInfoMaxPercentUsed, 0},
                                       {kNANDHealthInfoHostReadErrors, 0},
                                       {kNANDHealthInfoMaxE2EErrors, 0},
                                       {kNANDHealthInfoNumGrownBadBlocks, 0},
                                       {kNANDHealthInfoNumDieFailures, 0}};
constexpr NameRow kInternalLabFigures[] = {{kNANDHealthInfoMaxPercentUsed, 0},
                                           {kNANDHealthInfoHostReadErrors, 0},
                                           {kNANDHealthInfoMaxE2EErrors, 0},
                                           {kNANDHealthInfoSpareAvailablePercent, 0},
                                           {kNANDHealthInfoNumGrownBadBlocks, 0}};
constexpr NameRow kOTAFigures[] = {{kNANDHealthInfoMaxPercentUsed, 0},
                                   {kNANDHealthInfoHostReadErrors, 0},
                                   {kNANDHealthInfoMaxE2EErrors, 0},
                                   {kNANDHealthInfoNumGrownBadBlocks, 0}};

std::int64_t maxPercentUsed(const Dictionary& ftl) {
  std::int32_t most = 0;
  for (const char* name : {"fwUpdatesPercentUsed", "slcPercentUsed", "percentUsed"}) {
    most = std::max(most, signed32(ftl, name).value_or(0));
  }
  return most;
}

std::int64_t maxE2EErrors(const Dictionary& ftl) {
  std::int64_t most = 0;
  for (std::uint64_t i = 0; i < 12; ++i) {
    most = std::max(most, signed64(ftl, indexed("E2EDPErrorCounters_", i)).value_or(0));
  }
  return most;
}

std::int64_t hostReadErrors(const Dictionary& ftl) {
  const auto* isQRT1 = ftl.number(kNANDInfoIsQRT1Controller);
  if (isQRT1 == nullptr) return 0;
  const std::int64_t errors = isQRT1->boolValue() ? signed32(ftl, "ueccReads").value_or(0)
                                                  : signed64(ftl, "raidSmartErrors").value_or(0);
  return std::max<std::int64_t>(errors, 0);
}

bool isRetirable(const Dictionary& health) {
  const auto* spare = health.number(kNANDHealthInfoSpareAvailablePercent);
  const auto* used = health.number(kNANDHealthInfoMaxPercentUsed);
  if (spare == nullptr || used == nullptr) return false;
  const std::int64_t s = spare->int64Value(), u = used->int64Value();
  return s >= 0 && u >= 0 && (s < 100 || u >= 100);
}

// The figures that a consumer gets; empty when there are none.
Dictionary figuresFor(const ControllerServices& services, std::span<const NameRow> names) {
  Dictionary health = healthInfo(services);
  if (health.empty()) SetAPIErrorMessage("CopyServitaNANDInfo: Unable to get health API fields");
  const NameTable table(names);
  return CreateFilteredDict(std::move(health), &table);
}

}  // namespace

Dictionary healthFigures(const Dictionary& ftl) {
  return {
      {kNANDHealthInfoMaxPercentUsed, maxPercentUsed(ftl)},
      {kNANDHealthInfoMaxE2EErrors, maxE2EErrors(ftl)},
      {kNANDHealthInfoHostReadErrors, hostReadErrors(ftl)},
      {kNANDHealthInfoNumGrownBadBlocks, signed64(ftl, "numGrownBad").value_or(-1)},
      {kNANDHealthInfoSpareAvailablePercent, signed64(ftl, "spareAvailablePercent").value_or(-1)},
      {kNANDHealthInfoNumDieFailures, signed64(ftl, "numDieFailures").value_or(-1)}};
}

Dictionary healthInfo(const ControllerServices& services) {
  const auto ftl = ftlStatistics(services, "gatherNANDHealthInfo: Unable to get FTL fields");
  return ftl ? healthFigures(*ftl) : Dictionary();
}

Dictionary servitaInfo(const ControllerServices& services) {
  Dictionary info = figuresFor(services, kServitaFigures);
  info.set(kTLM_APIErrorMessage, GetAPIErrorMessage());
  return info;
}

Dictionary internalLabInfo(const ControllerServices& services) {
  Dictionary info = figuresFor(services, kInternalLabFigures);
  info.set(kNANDHealthInfoIsNANDRetirable, std::int64_t{isRetirable(info)});
  info.set(kTLM_APIErrorMessage, GetAPIErrorMessage());
  return info;
}

Dictionary otaInfo(const ControllerServices& services) { return figuresFor(services, kOTAFigures); }

}  // namespace NANDInfo
