// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Sends events of the analytics sink for one step of the extraction, and logs what comes of it.
#pragma once

#include <memory>

#include "plist/Value.h"

namespace platform {
class Eventra;
class SystemLog;
}  // namespace platform

namespace NANDInfo {

// The sink may still read it while the step goes on.
using Payload = std::shared_ptr<const plist::Dictionary>;

Payload makePayload(plist::Dictionary fields);

// Whether the sink takes the event; nothing is logged.
bool sendEvent(platform::Eventra& eventra, const char* event, Payload payload);

class EventSender {
 public:
  // The lines begin with the name of the function that sends.
  EventSender(platform::SystemLog& log, platform::Eventra& eventra, const char* function)
      : log_(log), eventra_(eventra), function_(function) {}

  // Logs whether the sink wants the event, which is sent all the same.
  void announce(const char* event) const;

  // Whether the sink takes the event, which the line calls `what`.
  bool send(const char* event, const char* what, Payload payload) const;

 private:
  platform::SystemLog& log_;
  platform::Eventra& eventra_;
  const char* function_;
};

}  // namespace NANDInfo
