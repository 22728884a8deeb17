// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Submits storage health values as a log, at most once in seven days.
#pragma once

#include <string>
#include <string_view>

#include "NANDInfo/Services.h"
#include "base/CivilDate.h"
#include "plist/Value.h"

namespace NANDInfo {

// What NLW_WriteLog promises.
void writeNANDLog(const Services& services, std::string_view logType,
                  const plist::Dictionary* values);

// The key under which the device's logs are filed, or "error".
std::string faultwatchKey(platform::DeviceProperties& properties);

// The current date in UTC.
base::CivilDate currentDate(platform::Clock& clock);

}  // namespace NANDInfo
