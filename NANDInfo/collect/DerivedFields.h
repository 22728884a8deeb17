// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The fields that are derived from FTL counters, all of them sums and copies.
#pragma once

#include "plist/Value.h"

namespace NANDInfo {

// Of a dictionary of counters by name. Copies, the size of the intermediate partition and the boot
// blocks' failures only when there is what they are made of.
plist::Dictionary derivedFields(const plist::Dictionary& ftl);

// Of all derived fields those that go with the MSP and storage statistics.
plist::Dictionary sharedFields(const plist::Dictionary& derived);

// Copies an entry under a new key, if it is there.
void copyIfPresent(const plist::Dictionary& from, std::string_view key, plist::Dictionary& to,
                   std::string_view newKey);

}  // namespace NANDInfo
