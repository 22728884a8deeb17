// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/Whitelists.h"

#include <array>
#include <bit>
#include <cmath>
#include <string_view>

#include "NANDInfo/vocabulary/CounterLists.h"
#include "base/Convert.h"

namespace NANDInfo {

using plist::Dictionary;
using plist::Number;
using plist::Value;

const NameTable& WhitelistedRawNANDFTLCounters_SigDigDict() { return tableOf<kFTL>(); }
const NameTable& WhitelistedRawNANDMSPCounters_SigDigDict() { return tableOf<kMSP>(); }
const NameTable& WhitelistedStorageStats_SigDigDict() { return tableOf<kStorage>(); }
const NameTable& PrivacyApprovedSMagNANDFTLCounters_Accum() { return tableOf<kAccum>(); }
const NameTable& PrivacyApprovedSMagNANDFTLCounters_Dynamic() { return tableOf<kDynamic>(); }
const NameTable& PrivacyApprovedSMagNANDFTLCounters_SigDigDict() { return tableOf<kMagazine>(); }
const NameTable& FTLStats4MSPStats() { return tableOf<kAlong>(); }

Dictionary CreateFilteredDict(Dictionary dictionary, const NameTable* allowed) {
  if (allowed == nullptr) return dictionary;
  dictionary.keepIf(
      [allowed](std::string_view key, const Value&) { return allowed->contains(key); });
  return dictionary;
}

Dictionary CreateFilteredDict_SigDig(Dictionary dictionary, const NameTable* significantDigits,
                                     bool round) {
  if (significantDigits == nullptr) return dictionary;
  dictionary.keepIf([significantDigits, round](std::string_view key, Value& value) {
    const NameTable::Entry* const name = significantDigits->find(key);
    if (name == nullptr) return false;
    const Number* const number = round ? value.as<Number>() : nullptr;
    if (number != nullptr) value = roundSig(number->uint64Value(), name->number);
    return true;
  });
  return dictionary;
}

std::uint64_t roundSig(std::uint64_t value, std::uint64_t digits) {
  static constexpr auto kPowersOfTen = [] {
    std::array<std::uint64_t, 19> powers{1};
    for (std::size_t i = 1; i < powers.size(); ++i) powers[i] = 10 * powers[i - 1];
    return powers;
  }();
  if (value == 0) return 0;
  // The logarithm in a double decides, also where it rounds up to the next number of digits.
  const auto length =
      base::saturatingCast<std::uint64_t>(std::log10(static_cast<double>(value)) + 1.0);
  if (length <= digits) return value;
  if (length - digits >= kPowersOfTen.size()) return 0;
  const std::uint64_t power = kPowersOfTen[length - digits];
  const std::uint64_t quotient = value / power;
  const std::uint64_t remainder = value % power;
  return (remainder >= power >> 1 ? quotient + 1 : quotient) * power;
}

std::uint32_t GetUserCapacityInGB(std::uint32_t megabytes) {
  // The one marketed capacity that is no power of two: 1344 GB to 1729 GB are sold as 1536.
  if ((megabytes - 1344 * 1024) >> 10 < 385) return 1536;
  return static_cast<std::uint32_t>(std::uint64_t{1} << std::bit_width(megabytes) >> 10);
}

}  // namespace NANDInfo
