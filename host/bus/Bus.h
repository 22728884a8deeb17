// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The message bus and the event loop of the process: sd-bus attached to sd-event.
//
// The bus is the system bus, or the one that DBUS_SYSTEM_BUS_ADDRESS names. It is connected to by
// the first use that needs it, at most once in the life of the process: after a failure, or once
// the connection is lost, there is no bus. Whatever the bus does, connecting and waiting for its
// answers take a few seconds at most. All of it belongs to one thread.
//
// Who may send is the bus's policy; every message that it lets through is delivered. A bus may keep
// a message that starts the service for as long only as its sender stays (dbus-daemon does). A
// sender that leaves at once calls Ping first: an answer means that the service is up, and waits
// for messages anew.
#pragma once

#include <chrono>
#include <memory>
#include <string_view>

#include "platform/EventLoop.h"
#include "platform/SystemLog.h"

struct sd_bus;
struct sd_event;

namespace host {

class Bus : public platform::EventLoop,
            public platform::NamedServices,
            public platform::NotificationCenter {
 public:
  // `patience` is the longest wait for an answer of the bus.
  explicit Bus(platform::SystemLog& log,
               std::chrono::milliseconds patience = std::chrono::seconds(5));

  // Hands over what is not sent yet, waiting for a slow bus within the patience. Listeners go
  // first.
  ~Bus() override;

  // EventLoop. A handled event is a call to the service, whatever becomes of it: one of another
  // signature, or a sign of life (Ping), too. The bus's own traffic isn't. A run whose time is out
  // closes the service: it releases the bus name and serves what was sent while the name was owned.
  // If there was anything, it takes the name again and reports a handled source; else the run has
  // timed out, and the service stays closed. Without a bus a run waits for its time.
  //
  // End signals, if they are deferred (EndSignals.h), end this run and all others: what is queued
  // stays undelivered. One that comes while the service is being closed doesn't count for this run,
  // whose time is out; who supervises the process may send it because the name is gone.
  RunResult run(double seconds, bool returnAfterSourceHandled) override;

  // NamedServices. Takes the service's name on the bus, without queueing for it, and serves the
  // method Message(a{sv}) of the interface with that name, on the object whose path is the name
  // with slashes. No message is ever answered; one with another signature is dropped. Null without
  // a bus, when the name is taken or isn't ours to take, and while there is another listener.
  std::unique_ptr<platform::NamedServiceListener> listen(std::string_view serviceName) override;

  // NotificationCenter. The broadcast signal "c" of the interface "a.b" for the notification
  // "a.b.c". A name that can't be split so is dropped with an error line. Never waits, except to
  // connect.
  void postNotification(std::string_view name) override;

 private:
  using Clock = std::chrono::steady_clock;
  class Listener;
  struct CloseBus {
    void operator()(sd_bus* bus) const;
  };
  struct FreeLoop {
    void operator()(sd_event* loop) const;
  };

  bool connect();
  int finishHandshake();
  void disconnect();
  bool haveLoop();
  bool isToldToEnd() const;
  void serve(Clock::duration atMost);
  bool openService();
  bool closeService();
  void flush();
  void failed(platform::LogLevel level, const char* what, int error);

  platform::SystemLog& log_;
  std::chrono::milliseconds patience_;
  std::unique_ptr<sd_event, FreeLoop> loop_;  // made when it is first needed
  std::unique_ptr<sd_bus, CloseBus> bus_;
  bool tried_ = false;  // whether connecting was tried
  Listener* listener_ = nullptr;
  bool endSignalTaken_ = false;
};

}  // namespace host
