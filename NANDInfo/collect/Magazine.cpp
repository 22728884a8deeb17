#include "NANDInfo/Magazine.h"

#include <optional>
#include <utility>

#include "NANDInfo/APIErrorMessage.h"
#include "NANDInfo/Collectors.h"
#include "NANDInfo/Keys.h"
#include "NANDInfo/Utilities.h"
#include "NANDInfo/collect/MagazineDeltas.h"

namespace NANDInfo {

using plist::Dictionary;
using plist::Number;
using plist::Value;

namespace {

std::optional<Dictionary> snapshot(const Services& services, std::uint64_t hours) {
  auto counters = gatherZMCFTLData(services, FTLParser::named, FTLSource::readStatistics,
                                   static_cast<std::uint32_t>(hours));
  if (counters) addMagazineTimeStamp(*counters);
  return counters;
}

void addWindow(Dictionary& result, const Dictionary& newer, const Dictionary& older, bool deltas,
               std::uint32_t mode) {
  if (const auto days = magazineDeltaDays(newer, older)) {
    result.set(kTLM_SM_deltaDays, *days);
    addEntries(magazineDeltas(newer, older, deltas && *days > 0.0, mode), result);
  } else {
    SetAPIErrorMessage("CopyWhitelistedNANDFTLInfo: Unable to gather other stats magazine deltas");
  }
}

}  // namespace

Dictionary CopySMagNANDFTLInfo(const Services& services, std::uint64_t hours,
                               std::uint32_t deltaFlag, std::uint32_t mode) {
  Dictionary result{{kNANDInfoIsStatMagSupported, std::int32_t{0}}};
  const auto newer = snapshot(services, 0);
  const auto older = snapshot(services, hours);
  if (const Value* const supported = newer ? newer->find(kNANDInfoIsStatMagSupported) : nullptr) {
    result.set(kNANDInfoIsStatMagSupported, *supported);
  }
  if (newer && older) {
    addWindow(result, *newer, *older, deltaFlag != 0, mode);
  } else if (older) {
    addEntries(*older, result);
  }
  addEntries(gatherZMCFTLOtherData(services, newer ? &*newer : nullptr), result);

  const auto statistics = gatherZMCFTLData(services, FTLParser::named, FTLSource::statistics, 0);
  if (statistics && statistics->empty()) {
    SetAPIErrorMessage("CopySMagNANDFTLInfo: Unable to gather new delta fields");
  } else if (statistics) {
    setAveragePECycles(result, *statistics);
  }
  result.set(kTLM_APIErrorMessage, GetAPIErrorMessage());
  return result;
}

Dictionary CopySMagNANDFTLCustomHistoryInfo(const Services& services, std::uint32_t skips) {
  auto newer = snapshot(services, 0);
  const Number* const supported = newer ? newer->number(kNANDInfoIsStatMagSupported) : nullptr;
  if (supported != nullptr && !supported->boolValue()) {
    return {{kNANDInfoErrorMessageKey, GetAPIErrorMessage()}};
  }
  if (skips != 0) return {};

  Dictionary result;
  std::uint64_t hours = 0;
  for (const char* const key : kTLM_instantaneous_gc_wamp_array) {
    auto older = snapshot(services, hours += 4);
    result.set(key, newer && older ? instantaneousWriteAmplification(*newer, *older)
                                   : Value(std::int32_t{0}));
    newer = std::move(older);
  }
  return result;
}

}  // namespace NANDInfo
