// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/collect/MagazineDeltas.h"

#include "NANDInfo/Keys.h"
#include "NANDInfo/Magazine.h"
#include "NANDInfo/Whitelists.h"
#include "NANDInfo/decode/Counters.h"

namespace NANDInfo {

using plist::Dictionary;
using plist::Number;
using plist::Value;

namespace {

// The accumulated value over a count of bands.
void setAverage(Dictionary& window, const char* average, const char* erases, const Number* end,
                const Number* start) {
  const Number* const accumulated = window.number(erases);
  if (accumulated == nullptr || end == nullptr || start == nullptr) return;
  const double bands = end->doubleValue() - start->doubleValue();
  window.set(average, bands == 0.0 ? 0.0 : accumulated->doubleValue() / bands);
}

}  // namespace

void addMagazineTimeStamp(Dictionary& snapshot) {
  if (const Number* const meta = snapshot.number("magazineInstanceMeta")) {
    snapshot.set(kTLM_magazineTimeStamp, meta->uint64Value() >> 24 & 0xFFFFFFFF);
  }
}

std::optional<double> magazineDeltaDays(const Dictionary& newer, const Dictionary& older) {
  const Number* const later = newer.number(kTLM_magazineTimeStamp);
  const Number* const earlier = older.number(kTLM_magazineTimeStamp);
  if (later == nullptr || earlier == nullptr) return std::nullopt;
  return static_cast<double>(later->int64Value() - earlier->int64Value()) / 86400.0;
}

base::Result<Dictionary> magazineWindow(const Dictionary& newer, const Dictionary& older,
                                        bool differences, std::uint32_t mode) {
  const auto days = magazineDeltaDays(newer, older);
  if (!days) {
    return base::Error{"CopyWhitelistedNANDFTLInfo: Unable to gather other stats magazine deltas"};
  }
  const bool subtracts = differences && *days > 0.0;
  const bool accumulating = mode == kMagazineAccumulating || mode == kMagazineBoth;
  const bool dynamic = mode == kMagazineDynamic || mode == kMagazineBoth;
  const NameTable& accumulated = PrivacyApprovedSMagNANDFTLCounters_Accum();
  const NameTable& current = PrivacyApprovedSMagNANDFTLCounters_Dynamic();
  Dictionary window{{kTLM_SM_deltaDays, *days}};
  for (const auto& [key, value] : older) {
    const Number* const now = newer.number(key);
    const Number* const then = value.as<Number>();
    if (now == nullptr || then == nullptr) continue;
    if (accumulating && accumulated.contains(key)) {
      window.set(key, subtracts ? now->doubleValue() - then->doubleValue() : then->doubleValue());
    }
    if (dynamic && current.contains(key)) window.set(key, value);
  }
  return window;
}

void setAveragePECycles(Dictionary& window, const Dictionary& statistics) {
  const Number* const user = statistics.number("userPartitionStart");
  setAverage(window, "averageTLCPECycles", "bandErases", statistics.number("numVirtualBlocks"),
             user);
  setAverage(window, "averageSLCPECycles", "intermediateBandErases", user,
             statistics.number("intermediatePartitionStart"));
}

Value instantaneousWriteAmplification(const Dictionary& newer, const Dictionary& older) {
  const Number* const now = newer.number("gcWrites");
  const Number* const then = older.number("gcWrites");
  if (now == nullptr || then == nullptr) return std::int32_t{0};
  if (magazineDeltaDays(newer, older).value_or(0.0) <= 0.0) return std::int32_t{0};
  if (now->doubleValue() - then->doubleValue() < 1.0) return std::int32_t{0};

  double left = 1.0;
  std::uint32_t bucket = 1;
  for (; bucket <= 31; ++bucket) {
    if (const Number* const bands = older.number(indexed("vcurve_", bucket))) {
      left = left - (1.0 - 0.033 * bucket) * static_cast<double>(bands->int64Value());
    }
    if (left <= 0.0) break;
  }
  return 1.0 / (1.0 - 0.033 * bucket);
}

}  // namespace NANDInfo
