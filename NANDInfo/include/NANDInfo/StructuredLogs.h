// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The daily dump of the storage controller's diagnostic lists.
#pragma once

#include "NANDInfo/Services.h"
#include "base/Exported.h"
#include "plist/Value.h"

namespace MORVEND_EXPORTED NANDInfo {

// The validity list is wanted always. Nothing in the library sets it.
extern bool gForceCollectionSet;

// Works out the write amplification, and with it whether the validity list is wanted; then fetches
// the lists that the controller's driver offers and hands each to its handler. True when every list
// that could be fetched was handled. The flag goes to the driver with each command.
bool DumpStorageStructuredLog(const Services& services, bool flag);

// Adds the legacy counters, keys "com.norba.NANDInfo.…" without the version keys; nothing when they
// can't be had.
void DumpNANDInfo(const Services& services, plist::Dictionary& dictionary);

}  // namespace NANDInfo
