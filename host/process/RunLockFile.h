// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The run lock as an advisory lock on var/run/morvend.lock. The system gives it back with the
// process, however that ends; the file stays.
#pragma once

#include <chrono>
#include <optional>
#include <utility>

#include "base/Result.h"
#include "host/files/DeviceRoot.h"
#include "host/files/FileDescriptor.h"
#include "host/files/FileLock.h"
#include "platform/RunLock.h"
#include "platform/SystemLog.h"

namespace host {

class RunLockFile final : public platform::RunLock {
 public:
  static constexpr std::chrono::minutes kMaxWait{10};  // longer than any day's work

  // Root and log are borrowed; `pause` as in LockWait.
  RunLockFile(const DeviceRoot& root, platform::SystemLog& log,
              decltype(LockWait::pause) pause = LockWait::sleepFor)
      : root_(root), log_(log), pause_(std::move(pause)) {}

  // Where the file can't be opened or locked, or another process holds the lock for too long, an
  // error line says so and the run goes on without.
  void lock() override;
  void unlock() override;

 private:
  base::Result<void> take();

  const DeviceRoot& root_;
  platform::SystemLog& log_;
  const decltype(LockWait::pause) pause_;
  FileDescriptor file_;
  std::optional<FileLock> lock_;  // none while it isn't held
};

}  // namespace host
