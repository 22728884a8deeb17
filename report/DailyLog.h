// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The daily log: a report's sections under their header, and the way out.
#pragma once

#include <cstdint>
#include <string>

#include "plist/Value.h"
#include "report/Sections.h"
#include "report/Services.h"

namespace report {

// Activated-app info: one dictionary ("bundle", "version", "orloID", "arch", "uuid") for each
// application, as a client delivered it.
using ActivatedAppInfo = plist::Array;

// The log's header, apart from its version.
struct LogHeader {
  plist::Value tasking, taskID, taskDigest;  // as stored, or what stands for their absence
  plist::Date start, creation;               // of the reported day; of the log
  std::string whitelistDigest;
};

// The header of the log of a day that is written now. The tasking is a preference.
LogHeader headerForDay(const Services& services, std::int32_t day, std::string whitelistDigest);

// The whole log. `appInfo` may be null, which is not the same as empty.
plist::Dictionary buildLog(LogHeader header, Sections sections, const ActivatedAppInfo* appInfo);

// Submits a log's text, and tells which version of the system recorded the one before when that was
// another. The recorded version is updated whether or not the submission then succeeds. A failure
// is logged, and then this is false.
bool submitLog(const Services& services, const std::string& log);

}  // namespace report
