// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The lock that lets one daily sequence run at a time on a device.
#pragma once

namespace platform {

class RunLock {
 public:
  virtual ~RunLock() = default;

  // Waits until no other process holds the lock, then holds it. Not recursive.
  virtual void lock() = 0;
  virtual void unlock() = 0;
};

}  // namespace platform
