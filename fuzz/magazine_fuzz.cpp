// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The stats magazine: two snapshots, each a buffer of FTL statistics, and what a window over them
// holds.

#include <cmath>

#include "Input.h"
#include "NANDInfo/FTLDecoder.h"
#include "NANDInfo/Keys.h"
#include "NANDInfo/Magazine.h"
#include "NANDInfo/Whitelists.h"
#include "NANDInfo/collect/MagazineDeltas.h"

namespace {

using namespace NANDInfo;
using fuzz::require;
using plist::Dictionary;

Dictionary snapshotOf(std::span<const std::byte> buffer) {
  GenericParserCxt context;
  decodeFTL(buffer, &context);
  Dictionary snapshot = CreateDictFromCxt(context);
  addMagazineTimeStamp(snapshot);
  return snapshot;
}

void checkWindow(const Dictionary& newer, const Dictionary& older, bool differences,
                 std::uint32_t mode) {
  const auto days = magazineDeltaDays(newer, older);
  const auto window = magazineWindow(newer, older, differences, mode);
  require(static_cast<bool>(window) == days.has_value(), "two times make a window");
  if (!window) return;
  const bool subtracts = differences && *days > 0;
  const auto* place = older.begin();
  for (const auto& [key, value] : *window) {
    if (&value == &window->begin()->value) {
      require(key == kTLM_SM_deltaDays && value == plist::Value(*days), "it begins with its days");
      continue;
    }
    while (place != older.end() && place->key != key) ++place;
    require(place != older.end() && newer.find(key) != nullptr,
            "a counter is one of both, in order");
    const bool accumulates = PrivacyApprovedSMagNANDFTLCounters_Accum().contains(key);
    const bool isDynamic = PrivacyApprovedSMagNANDFTLCounters_Dynamic().contains(key);
    require(
        (accumulates && mode != kMagazineDynamic) || (isDynamic && mode != kMagazineAccumulating),
        "nothing leaves that its list doesn't name");
    require(mode <= kMagazineBoth, "a mode that isn't known reports nothing");
    const double then = older.number(key)->doubleValue(), now = newer.number(key)->doubleValue();
    const double number = window->number(key)->doubleValue();
    require(number == (isDynamic || !subtracts ? then : now - then), "it is the difference");
  }
}

void checkAmplification(const Dictionary& newer, const Dictionary& older) {
  const auto value = instantaneousWriteAmplification(newer, older);
  const auto* number = value.as<plist::Number>();
  require(number != nullptr, "an amplification is a number");
  if (!number->isReal()) return require(number->int64Value() == 0, "none is 0");
  const double bucket = (1.0 - 1.0 / number->doubleValue()) / 0.033;
  require(bucket > 0.999 && bucket < 32.001, "a bucket of the curve decides");
  require(std::abs(bucket - std::round(bucket)) < 1e-6, "and only one");
}

void checkAverages(const Dictionary& window, const Dictionary& statistics) {
  Dictionary with = window;
  setAveragePECycles(with, statistics);
  for (const auto& [key, value] : with) {
    const bool isAverage = key == "averageTLCPECycles" || key == "averageSLCPECycles";
    if (!isAverage) require(*window.find(key) == value, "an average changes nothing else");
    if (isAverage) require(std::isfinite(with.number(key)->doubleValue()), "it is a number");
  }
  require(with.size() <= window.size() + 2, "there are two averages");
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size) {
  fuzz::Input input(bytes, size);
  const unsigned how = input.number<std::uint8_t>();
  const auto first = input.bytes(input.number<std::uint16_t>() % 512);
  const Dictionary newer = snapshotOf(first), older = snapshotOf(input.rest());
  checkWindow(newer, older, (how & 4) != 0, how & 3);
  checkAmplification(newer, older);
  checkAverages(older, newer);
  return 0;
}
