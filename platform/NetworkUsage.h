// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The network usage service: what each process has sent and received.
#pragma once

#include <functional>

#include "plist/Value.h"

namespace platform {

class NetworkUsage {
 public:
  // Gets an array of usage records, borrowed for the call, or null. A record is a dictionary:
  // "bundleName" (missing for a process without a bundle) and "procName", texts; the date under
  // kUsageSinceKey; and the bytes since then, "wifiInBytes", "wifiOutBytes", "wwanInBytes" and
  // "wwanOutBytes".
  using Reply = std::function<void(const plist::Array* records)>;

  virtual ~NetworkUsage() = default;

  // Asks for the records of all processes, named by process name. The reply is called once, on the
  // service's own thread, however late, and then released; it may still come when the caller has
  // long gone on. One that has not begun when the service ends is released without a call.
  virtual void queryAllProcesses(Reply reply) = 0;
};

inline constexpr char kUsageSinceKey[] = "since";

}  // namespace platform
