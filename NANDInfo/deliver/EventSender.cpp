// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/deliver/EventSender.h"

#include <utility>

#include "platform/Eventra.h"
#include "platform/SystemLog.h"

namespace NANDInfo {

using platform::LogLevel;

Payload makePayload(plist::Dictionary fields) {
  return std::make_shared<const plist::Dictionary>(std::move(fields));
}

bool sendEvent(platform::Eventra& eventra, const char* event, Payload payload) {
  return eventra.EventraSendEventLazy(event, [payload = std::move(payload)] { return *payload; });
}

void EventSender::announce(const char* event) const {
  log_.log(LogLevel::standard, "NANDInfo: %s: %s enabled=%d\n", function_, event,
           eventra_.EventraIsEventUsed(event) ? 1 : 0);
}

bool EventSender::send(const char* event, const char* what, Payload payload) const {
  const bool sent = sendEvent(eventra_, event, std::move(payload));
  log_.log(LogLevel::standard,
           sent ? "NANDInfo: %s: SUCCESS in logging %s using EventraSendEventLazy\n"
                : "NANDInfo: %s: FAILED to log %s using EventraSendEventLazy\n",
           function_, what);
  return sent;
}

}  // namespace NANDInfo
