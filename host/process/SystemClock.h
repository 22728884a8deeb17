// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The host's clock and time zone.
#pragma once

#include "platform/Clock.h"

namespace host {

class SystemClock : public platform::Clock {
 public:
  plist::Date now() override;
  std::int32_t secondsFromUTC(plist::Date instant) override;
};

}  // namespace host
