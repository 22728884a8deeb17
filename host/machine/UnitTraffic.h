// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What systemd's units have sent and received, where that is accounted: asked over the system bus.
#pragma once

#include <chrono>
#include <cstdint>
#include <string>
#include <vector>

#include "base/Result.h"

namespace host::machine {

// Of a unit that is active, since it became so.
struct UnitTraffic {
  std::string name;
  double since;                  // seconds since 1970
  std::uint64_t received, sent;  // bytes
};

// Of services, scopes and sockets; slices are sums of these. None on a machine without a system
// bus, or without systemd on it. All of it takes no longer than the patience; a bus that takes
// longer, or fails otherwise, is an error. The bus is the one that DBUS_SYSTEM_BUS_ADDRESS names,
// or the system's; the connection is a call's own, so that any thread may ask.
base::Result<std::vector<UnitTraffic>> unitTraffic(std::chrono::milliseconds patience);

}  // namespace host::machine
