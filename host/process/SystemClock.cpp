// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/process/SystemClock.h"

#include <cmath>
#include <cstdint>
#include <ctime>

#include "base/Convert.h"

namespace host {

plist::Date SystemClock::now() {
  timespec time{};
  ::clock_gettime(CLOCK_REALTIME, &time);
  return {static_cast<double>(time.tv_sec) + static_cast<double>(time.tv_nsec) / 1e9};
}

std::int32_t SystemClock::secondsFromUTC(plist::Date instant) {
  const auto seconds = base::saturatingCast<std::time_t>(std::floor(instant.secondsSince1970));
  std::tm local{};
  ::tzset();
  return ::localtime_r(&seconds, &local) != nullptr ? static_cast<std::int32_t>(local.tm_gmtoff)
                                                    : 0;
}

}  // namespace host
