// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The NAND log: a header of named lines, then one line with all entries.
#pragma once

#include <cstdint>
#include <optional>
#include <string>

#include "plist/Value.h"

namespace NANDInfo {

// What the log says of its origin. What the device doesn't know appears as "(null)".
struct NANDLogOrigin {
  std::optional<std::string> systemIdentifier, hardwareModel;
  std::string operatingSystemVersion;
  std::string date;
  std::string incidentIdentifier;
  std::string faultwatchKey;
  std::string processName;
  std::int32_t processIdentifier;
};

// "<key>:<value>" joined with ";", in the dictionary's order: numbers, and arrays that hold one,
// their elements joined with ",". Reals have two decimals, but not in arrays. Other values have no
// entry.
std::string NANDLogEntries(const plist::Dictionary& values);

std::string NANDLogText(const NANDLogOrigin& origin, const std::string& entries);

// "2026-11-22 05:00:00 +0100": the instant in a zone that is so many seconds ahead of UTC.
std::string NANDLogDate(plist::Date instant, std::int32_t secondsFromUTC);

}  // namespace NANDInfo
