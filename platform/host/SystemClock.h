// The host's clock.
#pragma once

#include "platform/Clock.h"

namespace platform::host {

class SystemClock : public Clock {
 public:
  Date now() override;
};

}  // namespace platform::host
