// The wall clock.
#pragma once

#include "platform/PropertyList.h"

namespace platform {

class Clock {
 public:
  virtual ~Clock() = default;

  // The current time; it may jump, either way.
  virtual Date now() = 0;
};

}  // namespace platform
