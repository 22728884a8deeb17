// The host's clock and time zone.
#pragma once

#include "platform/Clock.h"

namespace platform::host {

class SystemClock : public Clock {
 public:
  Date now() override;
  std::int32_t secondsFromUTC(Date instant) override;
};

}  // namespace platform::host
