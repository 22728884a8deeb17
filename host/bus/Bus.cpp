// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/bus/Bus.h"

#include <systemd/sd-bus.h>
#include <systemd/sd-event.h>

#include <algorithm>
#include <cerrno>
#include <cstdint>
#include <cstring>
#include <string>
#include <thread>
#include <utility>

#include "base/Convert.h"
#include "host/bus/BusMessage.h"
#include "host/process/EndSignals.h"

namespace host {

namespace {

constexpr char kObjectPath[] = "/com/norba/pellorand/morvend";
constexpr char kMethod[] = "Message";
constexpr char kSignature[] = "a{sv}";
constexpr std::uint64_t kNoTimeout = UINT64_MAX;

// In the unit of sd-bus and sd-event, rounded up; a time that is over is 0.
std::uint64_t microseconds(std::chrono::steady_clock::duration duration) {
  const auto whole = std::chrono::ceil<std::chrono::microseconds>(duration).count();
  return whole > 0 ? static_cast<std::uint64_t>(whole) : 0;
}

struct SlotUnref {
  void operator()(sd_bus_slot* slot) const { sd_bus_slot_unref(slot); }
};
using Slot = std::unique_ptr<sd_bus_slot, SlotUnref>;

}  // namespace

void Bus::CloseBus::operator()(sd_bus* bus) const { sd_bus_close_unref(bus); }
void Bus::FreeLoop::operator()(sd_event* loop) const { sd_event_unref(loop); }

// ---- The service ------------------------------------------------------------------------------

class Bus::Listener : public platform::NamedServiceListener {
 public:
  Listener(Bus& bus, std::string_view name) : bus_(bus), name_(name) { bus_.listener_ = this; }

  ~Listener() override {
    if (ownsName_) sd_bus_release_name_async(connection(), nullptr, name(), nullptr, nullptr);
    bus_.listener_ = nullptr;
  }

  void start(EventHandler handler) override { handler_ = std::move(handler); }

  const char* name() const { return name_.c_str(); }
  bool ownsName() const { return ownsName_; }
  bool isReleasing() const { return releasing_; }

  // Whether the service was called since this was last asked.
  bool takeCalled() { return std::exchange(called_, false); }

  // All three: 0 or above on success, else a negative error number.
  int addObject();
  int takeName();
  int releaseName();

  void connectionLost() {
    ownsName_ = false;
    releasing_ = false;
    release_.reset();
    calls_.reset();
    declaration_.reset();
    filter_.reset();
    if (handler_) handler_(nullptr);
  }

 private:
  static int onAnything(sd_bus_message* message, void* listener, sd_bus_error*);
  static int onCall(sd_bus_message* call, void* listener, sd_bus_error*);
  static int onReleased(sd_bus_message* answer, void* listener, sd_bus_error*);
  void deliver(sd_bus_message* message);
  sd_bus* connection() const { return bus_.bus_.get(); }

  Bus& bus_;
  std::string name_;
  Slot filter_, declaration_, calls_, release_;
  EventHandler handler_;
  bool ownsName_ = false;
  bool releasing_ = false;
  bool called_ = false;
};

int Bus::Listener::addObject() {
  // Only a declaration, for introspection: onCall sees each call to the object first, because the
  // library would answer a call that has another signature.
  static const sd_bus_vtable methods[] = {
      SD_BUS_VTABLE_START(0),
      SD_BUS_METHOD(kMethod, kSignature, nullptr, onCall,
                    SD_BUS_VTABLE_UNPRIVILEGED | SD_BUS_VTABLE_METHOD_NO_REPLY),
      SD_BUS_VTABLE_END};
  std::string path = "/" + name_;
  std::replace(path.begin(), path.end(), '.', '/');
  sd_bus_slot* slot = nullptr;
  int result = sd_bus_add_filter(connection(), &slot, onAnything, this);
  if (result < 0) return result;
  filter_.reset(slot);
  result = sd_bus_add_object_vtable(connection(), &slot, path.c_str(), name(), methods, this);
  if (result < 0) return result;
  declaration_.reset(slot);
  result = sd_bus_add_object(connection(), &slot, path.c_str(), onCall, this);
  if (result >= 0) calls_.reset(slot);
  return result;
}

int Bus::Listener::takeName() {
  // Messages may come before the answer; they wait for the next run.
  sd_bus_set_method_call_timeout(connection(), microseconds(bus_.patience_));
  const int result = sd_bus_request_name(connection(), name(), 0);
  ownsName_ = result >= 0;
  return result;
}

int Bus::Listener::releaseName() {
  // All that was sent to the name comes before the answer. A handler may keep the answer waiting
  // for long, and that must not count as a time-out.
  sd_bus_set_method_call_timeout(connection(), kNoTimeout);
  sd_bus_slot* slot = nullptr;
  const int result = sd_bus_release_name_async(connection(), &slot, name(), onReleased, this);
  if (result < 0) return result;
  release_.reset(slot);
  releasing_ = true;
  ownsName_ = false;
  return 0;
}

int Bus::Listener::onReleased(sd_bus_message*, void* listener, sd_bus_error*) {
  static_cast<Listener*>(listener)->releasing_ = false;
  return 1;
}

int Bus::Listener::onAnything(sd_bus_message* message, void* listener, sd_bus_error*) {
  if (sd_bus_message_is_method_call(message, nullptr, nullptr) > 0) {
    static_cast<Listener*>(listener)->called_ = true;
  }
  return 0;  // for the others to see
}

int Bus::Listener::onCall(sd_bus_message* call, void* listener, sd_bus_error*) {
  auto& self = *static_cast<Listener*>(listener);
  const char* interface = sd_bus_message_get_interface(call);
  if (sd_bus_message_is_method_call(call, nullptr, kMethod) <= 0) return 0;
  if (interface != nullptr && self.name_ != interface) return 0;
  if (sd_bus_message_has_signature(call, kSignature) > 0) self.deliver(call);
  return 1;  // done with, without an answer
}

void Bus::Listener::deliver(sd_bus_message* message) {
  if (!handler_) return;
  const std::optional<BusDictionary> read = readDictionary(message);
  if (!read || read->dropped > 0) {
    const char* sender = sd_bus_message_get_sender(message);
    if (sender == nullptr) sender = "an unknown sender";
    if (!read) {
      bus_.log_.log(platform::LogLevel::error, "dropped a malformed message from %s", sender);
      return;
    }
    bus_.log_.log(platform::LogLevel::error,
                  "dropped %zu values of a message from %s that is too large", read->dropped,
                  sender);
  }
  handler_(&read->dictionary);
}

std::unique_ptr<platform::NamedServiceListener> Bus::listen(std::string_view serviceName) {
  if (listener_ != nullptr || !connect()) return nullptr;
  auto listener = std::make_unique<Listener>(*this, serviceName);
  if (const int result = listener->addObject(); result < 0) {
    failed(platform::LogLevel::error, "can't serve the object", result);
    return nullptr;
  }
  if (!openService()) return nullptr;
  return listener;
}

bool Bus::openService() {
  const int result = listener_->takeName();
  if (result < 0) failed(platform::LogLevel::error, "can't take the name of the service", result);
  if (result == -ETIMEDOUT) disconnect();
  return result >= 0;
}

bool Bus::closeService() {
  if (listener_ == nullptr || !listener_->ownsName()) return false;
  if (const int result = listener_->releaseName(); result < 0) {
    failed(platform::LogLevel::error, "can't release the name of the service", result);
    return false;
  }
  bool served = false;
  auto end = Clock::now() + patience_;
  while (bus_ && listener_->isReleasing()) {
    serve(end - Clock::now());
    if (listener_->takeCalled()) {
      served = true;
      end = Clock::now() + patience_;
    } else if (Clock::now() >= end) {
      failed(platform::LogLevel::error, "can't release the name of the service", -ETIMEDOUT);
      disconnect();
    }
  }
  if (served && bus_) openService();
  return served;
}

// ---- The event loop ---------------------------------------------------------------------------

Bus::Bus(platform::SystemLog& log, std::chrono::milliseconds patience)
    : log_(log), patience_(patience) {}

Bus::~Bus() { flush(); }

Bus::RunResult Bus::run(double seconds, bool returnAfterSourceHandled) {
  const auto duration = base::saturatingCast<std::int64_t>(std::clamp(seconds, 0.0, 1e9) * 1e6);
  const auto end = Clock::now() + std::chrono::microseconds(duration);
  do {
    if (isToldToEnd()) return RunResult::toldToEnd;
    serve(end - Clock::now());
    const bool called = listener_ != nullptr && listener_->takeCalled();
    if (called && returnAfterSourceHandled && Clock::now() < end) {
      return RunResult::handledSource;
    }
  } while (Clock::now() < end);
  if (isToldToEnd()) return RunResult::toldToEnd;
  return closeService() ? RunResult::handledSource : RunResult::timedOut;
}

bool Bus::haveLoop() {
  sd_event* loop = nullptr;
  if (loop_ || sd_event_new(&loop) < 0) return loop_ != nullptr;
  loop_.reset(loop);
  const auto take = [](sd_event_source*, const signalfd_siginfo*, void* bus) {
    static_cast<Bus*>(bus)->endSignalTaken_ = true;
    return 0;
  };
  // Refused for signals that aren't deferred.
  for (const int signal : kEndSignals) sd_event_add_signal(loop, nullptr, signal, take, this);
  return true;
}

bool Bus::isToldToEnd() const { return endSignalTaken_ || endSignalWaits(); }

void Bus::serve(Clock::duration atMost) {
  if (!haveLoop() || sd_event_run(loop_.get(), microseconds(atMost)) < 0) {
    std::this_thread::sleep_for(atMost);
  }
  if (bus_ && sd_bus_is_open(bus_.get()) <= 0) {
    log_.log(platform::LogLevel::error, "message bus: the connection is lost");
    disconnect();
  }
}

// ---- The connection ---------------------------------------------------------------------------

bool Bus::connect() {
  if (std::exchange(tried_, true) || !haveLoop()) return bus_ != nullptr;
  sd_bus* bus = nullptr;
  int result = sd_bus_open_system(&bus);
  if (result >= 0) {
    bus_.reset(bus);
    result = finishHandshake();
  }
  if (result >= 0) result = sd_bus_attach_event(bus, loop_.get(), SD_EVENT_PRIORITY_NORMAL);
  if (result >= 0) return true;
  // A machine without a bus is not a fault.
  const bool noBus = result == -ENOENT || result == -ECONNREFUSED;
  failed(noBus ? platform::LogLevel::info : platform::LogLevel::error, "can't connect", result);
  disconnect();
  return false;
}

// Drives the library ourselves: left alone, it waits for a silent bus for much longer.
int Bus::finishHandshake() {
  const auto end = Clock::now() + patience_;
  while (sd_bus_is_ready(bus_.get()) <= 0) {
    if (Clock::now() >= end) return -ETIMEDOUT;
    int result = sd_bus_process(bus_.get(), nullptr);
    if (result == 0) result = sd_bus_wait(bus_.get(), microseconds(end - Clock::now()));
    if (result < 0 && result != -EINTR) return result;
  }
  return 0;
}

void Bus::flush() {
  const auto end = Clock::now() + patience_;
  std::uint64_t queued = 0;
  while (bus_ && sd_bus_get_n_queued_write(bus_.get(), &queued) >= 0 && queued > 0 &&
         Clock::now() < end) {
    int result = sd_bus_process(bus_.get(), nullptr);
    if (result == 0) result = sd_bus_wait(bus_.get(), microseconds(end - Clock::now()));
    if (result < 0 && result != -EINTR) return;
  }
}

void Bus::disconnect() {
  bus_.reset();
  if (listener_ != nullptr) listener_->connectionLost();
}

void Bus::failed(platform::LogLevel level, const char* what, int error) {
  log_.log(level, "message bus: %s: %s", what, std::strerror(-error));
}

// ---- Notifications ----------------------------------------------------------------------------

void Bus::postNotification(std::string_view name) {
  const std::size_t dot = std::min(name.rfind('.'), name.size());
  const std::string interface(name.substr(0, dot));
  const std::string member(name.substr(std::min(dot + 1, name.size())));
  if (name.find('\0') != name.npos || sd_bus_interface_name_is_valid(interface.c_str()) <= 0 ||
      sd_bus_member_name_is_valid(member.c_str()) <= 0) {
    log_.log(platform::LogLevel::error,
             "dropped the notification \"%.*s\": not the name of a signal",
             static_cast<int>(name.size()), name.data());
    return;
  }
  if (!connect()) return;
  const int result =
      sd_bus_emit_signal(bus_.get(), kObjectPath, interface.c_str(), member.c_str(), nullptr);
  if (result < 0) failed(platform::LogLevel::error, "can't post a notification", result);
}

}  // namespace host
