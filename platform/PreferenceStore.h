// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The preference services: values by key and domain.
//
// Preferences belong to a user. PreferenceStore is the system's own view, AnalyticsConfiguration
// the view of the system analytics service, PrivilegedPreferences that of any user.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "base/Exported.h"
#include "base/Result.h"
#include "plist/Value.h"

namespace MORVEND_EXPORTED platform {

// In all three, a missing value in a write (a null pointer) removes the key.

class PreferenceStore {
 public:
  virtual ~PreferenceStore() = default;

  // The value of a key, or none. A write by this process is seen at once.
  virtual std::optional<plist::Value> QNSPreferencesGetValue(std::string_view key,
                                                             std::string_view domain) = 0;
  virtual void QNSPreferencesSetValue(std::string_view key, const plist::Value* value,
                                      std::string_view domain) = 0;

  // Brings the domain's writes to storage; without it they get there when the process ends.
  virtual void QNSPreferencesSynchronize(std::string_view domain) = 0;

  // The value of a key, or none, for whom none and one that can't be read are not the same.
  virtual base::Result<std::optional<plist::Value>> readValue(std::string_view key,
                                                              std::string_view domain) {
    return QNSPreferencesGetValue(key, domain);
  }

  // Between the two, what the other two views are to bring to storage at once waits for the end,
  // and is then written once for each domain of a user. Not nested.
  virtual void holdWrites() {}
  virtual void writeHeld() {}

  // The value as a number or as a truth value; 0 or false when it is absent or not a number.
  // `found`, if given, tells whether there was a number.
  std::int64_t QNSPreferencesGetIntegerValue(std::string_view key, std::string_view domain,
                                             bool* found = nullptr);
  bool QNSPreferencesGetBooleanValue(std::string_view key, std::string_view domain,
                                     bool* found = nullptr);
};

class AnalyticsConfiguration {
 public:
  virtual ~AnalyticsConfiguration() = default;

  virtual std::optional<plist::Value> getPreference(std::string_view key,
                                                    std::string_view domain) = 0;
  virtual void setPreference(std::string_view key, const plist::Value* value,
                             std::string_view domain, bool synchronize) = 0;

  // The bug types of the logs that are switched off; elements that aren't texts are left out.
  virtual std::vector<std::string> logBlocklist() = 0;
};

class PrivilegedPreferences {
 public:
  virtual ~PrivilegedPreferences() = default;

  virtual void setPreference(std::string_view key, std::string_view user, std::string_view domain,
                             const plist::Value* value) = 0;
  virtual void deletePreference(std::string_view key, std::string_view user,
                                std::string_view domain) = 0;
};

}  // namespace platform
