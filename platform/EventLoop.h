// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The process's event loop, and what is delivered through it: messages to a named service.
#pragma once

#include <functional>
#include <memory>
#include <string_view>

#include "plist/Value.h"

namespace platform {

class EventLoop {
 public:
  // `toldToEnd`: the process is asked to end, and nothing is to be waited for any more.
  enum class RunResult { finished, stopped, timedOut, handledSource, toldToEnd };

  virtual ~EventLoop() = default;

  // Serves events on the calling thread for at most the given time. With
  // `returnAfterSourceHandled` it returns after one event; an event whose handler outlasts the time
  // ends the run as timed out.
  virtual RunResult run(double seconds, bool returnAfterSourceHandled) = 0;
};

// A listener of a named service; the service is open to messages while it lives.
class NamedServiceListener {
 public:
  // An event of the service: a dictionary for a message, null for anything else (an error, the end
  // of a connection).
  using EventHandler = std::function<void(const plist::Dictionary* message)>;

  virtual ~NamedServiceListener() = default;

  // Delivers events to the handler, inside runs of the event loop.
  virtual void start(EventHandler handler) = 0;
};

class NamedServices {
 public:
  virtual ~NamedServices() = default;

  // Registers a listener for the named service; null when it can't be registered.
  virtual std::unique_ptr<NamedServiceListener> listen(std::string_view serviceName) = 0;
};

class NotificationCenter {
 public:
  virtual ~NotificationCenter() = default;

  // Posts a system notification; it is dropped when nothing can carry it.
  virtual void postNotification(std::string_view name) = 0;
};

}  // namespace platform
