// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The run lock as an advisory lock on var/run/morvend.lock. The system gives it back with the
// process, however that ends; the file stays.
#pragma once

#include "host/files/DeviceRoot.h"
#include "host/files/FileDescriptor.h"
#include "platform/RunLock.h"
#include "platform/SystemLog.h"

namespace host {

class RunLockFile final : public platform::RunLock {
 public:
  // Both are borrowed.
  RunLockFile(const DeviceRoot& root, platform::SystemLog& log) : root_(root), log_(log) {}

  // Where the file can't be opened or locked, an error line says so and the run goes on without.
  void lock() override;
  void unlock() override;

 private:
  const DeviceRoot& root_;
  platform::SystemLog& log_;
  FileDescriptor file_;  // empty while the lock isn't held
};

}  // namespace host
