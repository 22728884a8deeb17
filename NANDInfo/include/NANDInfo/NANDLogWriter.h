// Writes storage health values as a log for submission, at most once in seven days.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "base/Exported.h"
#include "plist/Value.h"

namespace platform {
struct Platform;
}

namespace MORVEND_EXPORTED NANDInfo {

// Submits the values as the log "StorageStatus" of the given type, and notes the time as
// "SSLastLoggedAt" in the process's preferences, however the submission went. Within seven days of
// that time nothing is written, nor without values (null). Standard exceptions end in the log.
void NLW_WriteLog(platform::Platform& platform, std::string_view logType,
                  const plist::Dictionary* values);

// The key under which the device's logs are filed, or "error".
std::string GetFaultwatchKey(platform::Platform& platform);

// Of the current date in UTC; months from 1 to 12.
int GetCurrentMonthNumber(platform::Platform& platform);
std::int64_t GetCurrentYear(platform::Platform& platform);

}  // namespace NANDInfo
