// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The analytics event sink.
#pragma once

#include <functional>
#include <string_view>

#include "plist/Value.h"

namespace platform {

class Eventra {
 public:
  using PayloadProducer = std::function<plist::Dictionary()>;

  virtual ~Eventra() = default;

  // Whether the sink of this device has the lazy-send operation.
  virtual bool offersLazySend() { return true; }

  virtual bool EventraIsEventUsed(std::string_view event) = 0;

  // Sends an event whose payload is built only if the sink wants it: later, and on the sink's own
  // thread, so the producer holds what it needs. True when the event is used and could be queued.
  virtual bool EventraSendEventLazy(std::string_view event, PayloadProducer producer) = 0;
};

}  // namespace platform
