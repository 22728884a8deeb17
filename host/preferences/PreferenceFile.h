// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// One preference file: a domain of a user, var/preferences/<user>/<domain>.plist, and the changes
// that this process has yet to write to it.
//
// Reads see what other processes have written, and this process's changes before they are. Writing
// merges under a lock on the user's folder: the file is read again and only the changed keys are
// replaced. A file that can't be understood reads as empty and is kept as <domain>.plist.corrupt
// before it is replaced. Links within the root are followed to what is read; where the file would
// be replaced they are refused, and so is one with several names. Failures are logged here: a state
// of the file, or a reason why it can't be written, once for as long as it lasts. Not thread-safe.
#pragma once

#include <sys/stat.h>

#include <cstdint>
#include <functional>
#include <optional>
#include <set>
#include <string>
#include <string_view>

#include "base/Result.h"
#include "host/files/DeviceRoot.h"
#include "platform/SystemLog.h"
#include "plist/PropertyList.h"

namespace host {

class PreferenceFile {
 public:
  // Both names are plain file names, with room for what is appended to them; the rest is borrowed.
  PreferenceFile(const DeviceRoot& root, platform::SystemLog& log, std::string_view user,
                 std::string_view domain);

  // The value of a key, or none; the error, of the file's path, says why the file can't be read.
  base::Result<std::optional<plist::Value>> value(std::string_view key);

  // Sets a key, or removes it (null); to be written by the next flush.
  void change(std::string_view key, const plist::Value* value);

  // Brings the changes to the file, unless they are held back. What couldn't be written stays a
  // change.
  void flush();

  // From `hold` on changes are held back, so that `release` brings them to the file together, or
  // `drop` forgets them.
  void hold() { held_ = true; }
  void release() {
    held_ = false;
    flush();
  }
  void drop() {
    held_ = false;
    forgetChanges();
  }

  // Whether the last change or addition is in the file; the error is of the file's path.
  base::Result<void> written() const;

  // Flushes, and adds to an integer in the same write: no process's addition is lost. A value that
  // is missing or not a number counts as 0; the sum saturates. An addition that can't be written is
  // lost. What is held back stays so: the addition is in the file, and in the change, if there is
  // one.
  void add(std::string_view key, std::int64_t delta);

 private:
  enum class State { absent, whole, broken, unreadable };
  using Edit = std::function<void(plist::Dictionary& values)>;

  void load(bool evenIfUnchanged);
  plist::Dictionary takeStored();
  void fail(State state, const base::Error& why);
  void forgetChanges();
  void write(const Edit& edit);
  base::Result<void> merge(const Edit& edit);
  std::string path() const { return root_.hostPath(folder_, name_); }

  const DeviceRoot& root_;
  platform::SystemLog& log_;
  const std::string folder_;
  const std::string name_;

  // What was last read, and the status of the file that it was read from.
  State state_ = State::absent;
  struct stat status_ {};
  plist::Dictionary stored_;
  bool isLarge_ = false;

  plist::Dictionary set_;
  std::set<std::string, std::less<>> removed_;
  bool held_ = false;

  std::optional<base::Error> readError_;
  base::Result<void> written_;
};

}  // namespace host
