// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Storage health: what the flash controller counts, as dictionaries that are whitelisted and
// rounded as far as their names say.
//
// Every function takes the platform that it asks. None throws; what went wrong first in the process
// is GetAPIErrorMessage(), and most dictionaries carry it under "TLM_APIErrorMessage". The library
// is called from one thread at a time.
#pragma once

#include <optional>

#include "NANDInfo/APIErrorMessage.h"
#include "NANDInfo/Collectors.h"
#include "NANDInfo/Controller.h"
#include "NANDInfo/CounterRecords.h"
#include "NANDInfo/DefectsList.h"
#include "NANDInfo/DriverService.h"
#include "NANDInfo/EAN.h"
#include "NANDInfo/Events.h"
#include "NANDInfo/Extraction.h"
#include "NANDInfo/FTLDecoder.h"
#include "NANDInfo/GenericParserContext.h"
#include "NANDInfo/Keys.h"
#include "NANDInfo/LegacyDecoder.h"
#include "NANDInfo/MSPDecoder.h"
#include "NANDInfo/Magazine.h"
#include "NANDInfo/NANDLogWriter.h"
#include "NANDInfo/Parsers.h"
#include "NANDInfo/Services.h"
#include "NANDInfo/SnapshotReader.h"
#include "NANDInfo/StructuredLogs.h"
#include "NANDInfo/TelemetryList.h"
#include "NANDInfo/Utilities.h"
#include "NANDInfo/ValidityList.h"
#include "NANDInfo/Whitelists.h"
#include "base/Exported.h"
#include "plist/Value.h"

namespace MORVEND_EXPORTED NANDInfo {

// The basic dictionary, keys "com.norba.NANDInfo.…": from the legacy statistics, for the counters
// service. On failure only the two error keys.
std::optional<plist::Dictionary> CopyNANDInfo(const Services& services);

// The same, but empty on the days on which everything goes to the analytics sink. The options are
// not consulted.
std::optional<plist::Dictionary> CopyNANDInfoWithOptions(
    const Services& services, const plist::Dictionary* options = nullptr);

// Whether today's storage counters go to the analytics sink instead of the counters service: every
// other day, from the first or the second day of a boot session.
bool NandInfoShouldLogAllToEV(const Services& services);

// The whitelisted FTL statistics with the derived fields.
std::optional<plist::Dictionary> CopyWhitelistedNANDFTLInfo(const Services& services, bool round);

// All FTL statistics, under their names or under "Stat_<key>"; none unless enabled.
std::optional<plist::Dictionary> CopyNANDFTLInfo(const Services& services, bool statKeys,
                                                 bool enabled);

// Always none.
std::optional<plist::Dictionary> CopyWhitelistedNANDFTLCountersInfo();

// The whitelisted statistics of each MSP, under its index in decimal.
plist::Dictionary CopyWhitelistedNANDMSPInfo(const Services& services, bool round);

// A short summary with the EAN images' sizes and update counts.
plist::Dictionary CopyWhitelistedStorageStats(const Services& services, bool round);

// Capacity, fullness and available space of the user data volume.
plist::Dictionary GetDiskInfo(const Services& services);

// The bytes that the kernel's swap-out thread has written; empty when that isn't known.
plist::Dictionary CopyVMFreezerNANDInfo(const Services& services);

// The health figures for the warranty service, for internal lab tools and for system updates.
plist::Dictionary CopyServitaNANDInfo(const Services& services);
plist::Dictionary CopyInternalLabNANDInfo(const Services& services);
plist::Dictionary CopyOTANANDInfo(const Services& services);

// Whether the controller asks for content to be deleted: a boolean.
plist::Value NandRecommendsContentDeletion(const Services& services);

}  // namespace NANDInfo
