// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Writes storage health values as a log for submission, at most once in seven days.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "NANDInfo/Services.h"
#include "base/Exported.h"
#include "plist/Value.h"

namespace MORVEND_EXPORTED NANDInfo {

// Submits the values as the log "StorageStatus" of the given type, and notes the time as
// "SSLastLoggedAt" in the process's preferences, however the submission went. Within seven days of
// that time nothing is written, nor without values (null). Standard exceptions end in the log.
void NLW_WriteLog(const Services& services, std::string_view logType,
                  const plist::Dictionary* values);

// The key under which the device's logs are filed, or "error".
std::string GetFaultwatchKey(const Services& services);

// Of the current date in UTC; months from 1 to 12.
int GetCurrentMonthNumber(const Services& services);
std::int64_t GetCurrentYear(const Services& services);

}  // namespace NANDInfo
