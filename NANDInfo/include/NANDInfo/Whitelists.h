// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Which counters may leave the device, how coarse, and under which name.
#pragma once

#include <cstdint>

#include "NANDInfo/NameTable.h"
#include "base/Exported.h"
#include "plist/Value.h"

namespace MORVEND_EXPORTED NANDInfo {

// Significant-digits dictionaries: a counter that is in one may be reported, and its number is how
// many significant decimal digits it keeps. Each is expanded at its first use.
const NameTable& WhitelistedRawNANDFTLCounters_SigDigDict();
const NameTable& WhitelistedRawNANDMSPCounters_SigDigDict();
const NameTable& WhitelistedStorageStats_SigDigDict();
const NameTable& PrivacyApprovedSMagNANDFTLCounters_Accum();
const NameTable& PrivacyApprovedSMagNANDFTLCounters_Dynamic();
const NameTable& PrivacyApprovedSMagNANDFTLCounters_SigDigDict();

// The derived fields that go with the MSP and storage statistics, in order.
const NameTable& FTLStats4MSPStats();

// The entries whose key the collection holds, in their order; null lets everything through.
plist::Dictionary CreateFilteredDict(plist::Dictionary dictionary, const NameTable* allowed);

// The same with a significant-digits dictionary; with `round`, numbers become unsigned 64-bit and
// keep their digits, other values pass as they are.
plist::Dictionary CreateFilteredDict_SigDig(plist::Dictionary dictionary,
                                            const NameTable* significantDigits, bool round);

// The value with so many significant decimal digits, rounded half up.
std::uint64_t roundSig(std::uint64_t value, std::uint64_t digits);

// The marketed capacity in gigabytes of a user capacity in megabytes.
std::uint32_t GetUserCapacityInGB(std::uint32_t megabytes);

}  // namespace NANDInfo
