// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The wall clock, and the device's time zone.
#pragma once

#include <cstdint>

#include "plist/Value.h"

namespace platform {

class Clock {
 public:
  virtual ~Clock() = default;

  // The current time; it may jump, either way.
  virtual plist::Date now() = 0;

  // How far the device's clocks are ahead of UTC at an instant, in seconds.
  virtual std::int32_t secondsFromUTC(plist::Date instant) = 0;
};

}  // namespace platform
