// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The crash-reporting support library: structured-data logs, the identifiers of logs, and the two
// preference functions that it offers to those who load it at run time.
#pragma once

#include <cstdint>
#include <string>

#include "plist/Value.h"

namespace platform {

class FaultwatchSupport {
 public:
  virtual ~FaultwatchSupport() = default;

  // Appends one structured-data log to today's.
  virtual void logStructuredData(std::int32_t type, const plist::Dictionary& data) = 0;

  // Hands the structured-data logs of earlier days over for submission.
  virtual void dumpAllOldStructuredDataLogs() = 0;

  // A text that no other log carries: a random UUID.
  virtual std::string newIncidentIdentifier() = 0;
};

// Where the library lies, and the types of the functions that carry the names
// "QNSPreferencesGetIntegerValue" and "QNSPreferencesSetValue" in it. They act as the operations of
// PreferenceStore do.
inline constexpr char kFaultwatchSupportPath[] =
    "/System/Library/PrivateFrameworks/FaultwatchSupport.framework/FaultwatchSupport";
extern "C" {
using QNSPreferencesGetIntegerValueFunction = std::int64_t(const char* key, const char* domain,
                                                           bool* found);
using QNSPreferencesSetValueFunction = void(const char* key, const plist::Value* value,
                                            const char* domain);
}

}  // namespace platform
