// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The preference services over files, one for each domain of a user (see PreferenceFile). The
// system's own preferences are those of user "mobile", the analytics configuration's those of user
// "__quenset__".
//
// A user or domain that can't be a plain file name is refused with an error line. Thread-safe.
#pragma once

#include <map>
#include <mutex>
#include <string>
#include <vector>

#include "host/preferences/PreferenceFile.h"
#include "platform/PreferenceStore.h"

namespace host {

class PreferenceFiles final : public platform::PreferenceStore,
                              public platform::AnalyticsConfiguration,
                              public platform::PrivilegedPreferences {
 public:
  // All are borrowed.
  PreferenceFiles(const DeviceRoot& root, platform::SystemLog& log) : root_(root), log_(log) {}

  // Flushes everything.
  ~PreferenceFiles() override;

  // Writes what is not yet in the files; every domain is tried. The error is that of the first
  // file that couldn't be written, of its path.
  base::Result<void> flushAll();

  // From `hold` on a domain of user "mobile" is not synchronised, so that `release` writes all that
  // has changed meanwhile at once, or `drop` forgets it. Whether it could be written, the error of
  // the file's path.
  void hold(std::string_view domain);
  base::Result<void> release(std::string_view domain);
  void drop(std::string_view domain);

  // Adds to an integer of user "mobile", at once and atomically: see PreferenceFile::add.
  void addToInteger(std::string_view key, std::string_view domain, std::int64_t delta);

  // PreferenceStore
  std::optional<plist::Value> QNSPreferencesGetValue(std::string_view key,
                                                     std::string_view domain) override;
  void QNSPreferencesSetValue(std::string_view key, const plist::Value* value,
                              std::string_view domain) override;
  void QNSPreferencesSynchronize(std::string_view domain) override;
  base::Result<std::optional<plist::Value>> readValue(std::string_view key,
                                                      std::string_view domain) override;
  void holdWrites() override;
  void writeHeld() override;

  // AnalyticsConfiguration
  std::optional<plist::Value> getPreference(std::string_view key, std::string_view domain) override;
  void setPreference(std::string_view key, const plist::Value* value, std::string_view domain,
                     bool synchronize) override;
  std::vector<std::string> logBlocklist() override;

  // PrivilegedPreferences. Both write at once, or when held writes are: the user's own processes
  // shall see the change, and the interface has no later moment to ask for it.
  void setPreference(std::string_view key, std::string_view user, std::string_view domain,
                     const plist::Value* value) override;
  void deletePreference(std::string_view key, std::string_view user,
                        std::string_view domain) override;

 private:
  PreferenceFile* file(std::string_view user, std::string_view domain);
  base::Result<std::optional<plist::Value>> read(std::string_view user, std::string_view domain,
                                                 std::string_view key);
  std::optional<plist::Value> get(std::string_view user, std::string_view domain,
                                  std::string_view key);
  void set(std::string_view user, std::string_view domain, std::string_view key,
           const plist::Value* value, bool synchronize);

  const DeviceRoot& root_;
  platform::SystemLog& log_;
  std::mutex mutex_;
  std::map<std::string, PreferenceFile, std::less<>> files_;  // by "<user>/<domain>"
  bool holding_ = false;
  std::vector<PreferenceFile*> held_;  // to be written then, in the order of the changes
};

}  // namespace host
