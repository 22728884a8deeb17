// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// A run at another time than now, as a device's past is made of.
#pragma once

#include <cstdint>
#include <string>

#include "platform/Kernel.h"
#include "plist/Value.h"

namespace host {

// What such a run is told of itself.
struct PlayedRun {
  plist::Date now;          // its clock stands
  std::uint64_t sinceBoot;  // ticks
  platform::Kernel::Process process;
  std::string incident;  // the identifier of its logs
};

}  // namespace host
