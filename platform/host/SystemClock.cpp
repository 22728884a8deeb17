#include "platform/host/SystemClock.h"

#include <ctime>

namespace platform::host {

Date SystemClock::now() {
  timespec time{};
  ::clock_gettime(CLOCK_REALTIME, &time);
  return {static_cast<double>(time.tv_sec) + static_cast<double>(time.tv_nsec) / 1e9};
}

}  // namespace platform::host
