// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/collect/MagazineInfo.h"

#include <optional>
#include <utility>

#include "NANDInfo/APIErrorMessage.h"
#include "NANDInfo/Keys.h"
#include "NANDInfo/Utilities.h"
#include "NANDInfo/collect/DeviceFields.h"
#include "NANDInfo/collect/FTLStatistics.h"
#include "NANDInfo/collect/MagazineDeltas.h"
#include "NANDInfo/collect/Recorded.h"

namespace NANDInfo {

using plist::Dictionary;
using plist::Number;
using plist::Value;

namespace {

// The snapshot so many hours back, with its time; the controller takes the low 32 bits.
std::optional<Dictionary> snapshot(const ControllerServices& services, std::uint64_t hours) {
  auto counters = recorded(readFTLStatistics(services, FTLParser::named, FTLSource::readStatistics,
                                             static_cast<std::uint32_t>(hours)));
  if (counters) addMagazineTimeStamp(*counters);
  return counters;
}

}  // namespace

Dictionary magazineInfo(const CollectServices& services, std::uint64_t hours, bool differences,
                        std::uint32_t mode) {
  Dictionary info{{kNANDInfoIsStatMagSupported, std::int32_t{0}}};
  const auto newer = snapshot(services.controller, 0);
  const auto older = snapshot(services.controller, hours);
  if (const Value* const supported = newer ? newer->find(kNANDInfoIsStatMagSupported) : nullptr) {
    info.set(kNANDInfoIsStatMagSupported, *supported);
  }
  if (newer && older) {
    if (const auto window = recorded(magazineWindow(*newer, *older, differences, mode))) {
      addEntries(*window, info);
    }
  } else if (older) {
    addEntries(*older, info);
  }
  addEntries(otherFields(services, newer ? &*newer : nullptr), info);
  if (const auto statistics = ftlStatistics(services.controller)) {
    setAveragePECycles(info, *statistics);
  }
  info.set(kTLM_APIErrorMessage, GetAPIErrorMessage());
  return info;
}

Dictionary magazineHistory(const ControllerServices& services, bool skips) {
  auto newer = snapshot(services, 0);
  const Number* const supported = newer ? newer->number(kNANDInfoIsStatMagSupported) : nullptr;
  if (supported != nullptr && !supported->boolValue()) {
    return {{kNANDInfoErrorMessageKey, GetAPIErrorMessage()}};
  }
  if (skips) return {};

  Dictionary history;
  std::uint64_t hours = 0;
  for (const char* const key : kTLM_instantaneous_gc_wamp_array) {
    auto older = snapshot(services, hours += 4);
    history.set(key, newer && older ? instantaneousWriteAmplification(*newer, *older)
                                    : Value(std::int32_t{0}));
    newer = std::move(older);
  }
  return history;
}

}  // namespace NANDInfo
