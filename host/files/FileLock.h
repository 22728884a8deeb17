// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Locks between processes. Whoever holds one may be stopped, or mean harm: none is waited for
// without end.
#pragma once

#include <chrono>
#include <functional>
#include <string>

#include "base/Result.h"
#include "platform/SystemLog.h"

namespace host {

inline constexpr std::chrono::milliseconds kMaxLockWait = std::chrono::seconds(30);

// How a lock is waited for.
struct LockWait {
  platform::SystemLog& log;  // after a second a line says who holds the lock
  std::string path;          // what is locked, for that line: a path of the host
  std::chrono::milliseconds limit = kMaxLockWait;
  std::function<void(std::chrono::milliseconds)> pause = sleepFor;  // a test's ends at once

  static void sleepFor(std::chrono::milliseconds time);
};

// An exclusive lock on an open file or folder, given back at the end of the scope or of the
// process. The descriptor is borrowed. Two descriptions of one file exclude each other, in one
// process as well.
class FileLock {
 public:
  // Waits for it; std::errc::timed_out, with the holder, once that took as long as it may.
  static base::Result<FileLock> take(int file, const LockWait& wait);

  FileLock(FileLock&& other) noexcept;
  FileLock& operator=(FileLock&&) = delete;
  ~FileLock();

 private:
  explicit FileLock(int file) : file_(file) {}

  int file_;
};

}  // namespace host
