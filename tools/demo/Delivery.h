// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// A client of the running daemon: announces activated applications and delivers them.
#pragma once

#include <functional>
#include <string>
#include <string_view>

namespace demo {

// On the bus that DBUS_SYSTEM_BUS_ADDRESS names: waits for the daemon's name, sends operation 0,
// waits for the daemon's signal that it is waiting too, and sends operation 2 with three
// applications. Each step is told to `say`; each wait lasts five seconds at most. Returns the empty
// text, or what went wrong.
std::string deliver(const std::function<void(std::string_view)>& say);

}  // namespace demo
