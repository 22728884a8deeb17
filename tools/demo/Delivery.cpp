// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/demo/Delivery.h"

#include <systemd/sd-bus.h>

#include <algorithm>
#include <chrono>
#include <cstdint>
#include <cstring>
#include <memory>
#include <thread>

namespace demo {

namespace {

using Clock = std::chrono::steady_clock;

constexpr char kService[] = "com.norba.pellorand.morvend";  // its interface has the same name
constexpr char kPath[] = "/com/norba/pellorand/morvend";
constexpr auto kPatience = std::chrono::seconds(5);
constexpr auto kBetweenLooks = std::chrono::milliseconds(50);

struct Application {
  const char *bundle, *version;
  std::int64_t orloID, arch;
  unsigned char uuid[16];
};
constexpr Application kApplications[] = {
    {"com.example.chessboard",
     "3.2",
     710442,
     64,
     {0x3f, 0x1c, 0x9a, 0x52, 0x77, 0xe0, 0x4b, 0x18, 0x9d, 0x06, 0xaa, 0x41, 0x2e, 0x8b, 0xc5,
      0x90}},
    {"com.example.tidetables",
     "1.0.7",
     698810,
     64,
     {0x81, 0x5d, 0x20, 0xee, 0x03, 0x96, 0x4f, 0xa7, 0xb2, 0x64, 0x1b, 0x7c, 0xd9, 0x35, 0x48,
      0x0e}},
    {"com.example.translator",
     "12.1",
     533079,
     64,
     {0xc6, 0xb0, 0x4e, 0x13, 0x5a, 0x2f, 0x4d, 0x81, 0x8e, 0xf9, 0x70, 0x27, 0x63, 0xdc, 0x14,
      0xab}},
};

struct CloseBus {
  void operator()(sd_bus* bus) const { sd_bus_flush_close_unref(bus); }
};
struct FreeMessage {
  void operator()(sd_bus_message* message) const { sd_bus_message_unref(message); }
};
using Message = std::unique_ptr<sd_bus_message, FreeMessage>;

// One conversation. Functions return 0 or more, or a negative error number.
class Client {
 public:
  int open() {
    sd_bus* bus = nullptr;
    const int result = sd_bus_open_system(&bus);
    bus_.reset(bus);
    if (result < 0) return result;
    return sd_bus_match_signal(bus, nullptr, nullptr, kPath, kService, "logging", sawSignal, this);
  }

  int waitForName() {
    for (const auto end = Clock::now() + kPatience; Clock::now() < end;) {
      sd_bus_message* received = nullptr;
      int owned = 0;
      int result = sd_bus_call_method(bus_.get(), "org.freedesktop.DBus", "/org/freedesktop/DBus",
                                      "org.freedesktop.DBus", "NameHasOwner", nullptr, &received,
                                      "s", kService);
      const Message answer(received);
      if (result >= 0) result = sd_bus_message_read(received, "b", &owned);
      if (result < 0 || owned != 0) return result;
      std::this_thread::sleep_for(kBetweenLooks);
    }
    return -ETIMEDOUT;
  }

  int waitForSignal() {
    for (const auto end = Clock::now() + kPatience; !signalled_ && Clock::now() < end;) {
      int result = sd_bus_process(bus_.get(), nullptr);
      if (result == 0) {
        const auto left = std::chrono::duration_cast<std::chrono::microseconds>(end - Clock::now());
        result = sd_bus_wait(bus_.get(),
                             static_cast<std::uint64_t>(std::max<std::int64_t>(left.count(), 0)));
      }
      if (result < 0) return result;
    }
    return signalled_ ? 0 : -ETIMEDOUT;
  }

  int announce() {
    const Message call = newCall();
    const int result =
        sd_bus_message_append(call.get(), "a{sv}", 1, "operation", "x", std::int64_t{0});
    return result < 0 ? result : send(call);
  }

  int deliverApplications() {
    const Message owned = newCall();
    sd_bus_message* const call = owned.get();
    // Errors stay with the message: sending one that couldn't be built fails.
    sd_bus_message_open_container(call, 'a', "{sv}");
    sd_bus_message_append(call, "{sv}", "operation", "x", std::int64_t{2});
    sd_bus_message_open_container(call, 'e', "sv");
    sd_bus_message_append(call, "s", "app_data");
    sd_bus_message_open_container(call, 'v', "aa{sv}");
    sd_bus_message_open_container(call, 'a', "a{sv}");
    for (const Application& application : kApplications) append(call, application);
    for (int container = 0; container < 4; ++container) sd_bus_message_close_container(call);
    return send(owned);
  }

 private:
  static int sawSignal(sd_bus_message*, void* client, sd_bus_error*) {
    static_cast<Client*>(client)->signalled_ = true;
    return 0;
  }

  static void append(sd_bus_message* call, const Application& application) {
    sd_bus_message_open_container(call, 'a', "{sv}");
    sd_bus_message_append(call, "{sv}{sv}{sv}{sv}", "bundle_id", "s", application.bundle, "version",
                          "s", application.version, "orlo_id", "x", application.orloID, "arch", "x",
                          application.arch);
    sd_bus_message_open_container(call, 'e', "sv");
    sd_bus_message_append(call, "s", "uuid");
    sd_bus_message_open_container(call, 'v', "ay");
    sd_bus_message_append_array(call, 'y', application.uuid, sizeof application.uuid);
    for (int container = 0; container < 3; ++container) sd_bus_message_close_container(call);
  }

  Message newCall() {
    sd_bus_message* call = nullptr;
    sd_bus_message_new_method_call(bus_.get(), &call, kService, kPath, kService, "Message");
    return Message(call);
  }

  int send(const Message& call) {
    sd_bus_message_set_expect_reply(call.get(), 0);
    const int result = sd_bus_send(bus_.get(), call.get(), nullptr);
    return result < 0 ? result : sd_bus_flush(bus_.get());
  }

  std::unique_ptr<sd_bus, CloseBus> bus_;
  bool signalled_ = false;
};

}  // namespace

std::string deliver(const std::function<void(std::string_view)>& say) {
  static constexpr struct {
    const char* what;
    int (Client::*work)();
  } kSteps[] = {
      {"connecting to the message bus", &Client::open},
      {"waiting until the daemon owns com.norba.pellorand.morvend", &Client::waitForName},
      {"sending operation 0: app info will follow", &Client::announce},
      {"waiting for the signal com.norba.pellorand.morvend.logging", &Client::waitForSignal},
      {"sending operation 2: three activated applications", &Client::deliverApplications},
  };
  Client client;
  for (const auto& [what, work] : kSteps) {
    say(what);
    if (const int result = (client.*work)(); result < 0) {
      return std::string(what) + ": " + std::strerror(-result);
    }
  }
  return {};
}

}  // namespace demo
