// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The support service's logs.
#pragma once

namespace platform {

class ServitaLogs {
 public:
  virtual ~ServitaLogs() = default;

  // The daily roll-over: each log becomes its own first old one, the older ones move up by one.
  virtual void rollServitaLogs() = 0;
};

}  // namespace platform
