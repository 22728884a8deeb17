// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The messages of the named service "com.norba.pellorand.morvend".
#pragma once

#include "daemon/Services.h"
#include "device/DeviceContext.h"

namespace morvend {

// What the messages of one process leave behind. Main thread only.
struct ServiceState {
  bool AwaitingAppInfo = false;    // app info has been announced and not yet delivered
  bool firstMessageTaken = false;  // the one message that is not a delivery has been acted on
};

// Acts on one event of the service; `message` is null for an event that is not a message.
// Operations: 0 announces app info; 1 runs the day in "value"; 2 delivers app info in "app_data",
// which starts the gate if it was announced. Of all messages that aren't deliveries only the first
// has an effect. No message is answered.
void HandleServiceMessage(const Services& services, DeviceContext& context, ServiceState& state,
                          const plist::Dictionary* message);

}  // namespace morvend
