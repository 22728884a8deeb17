// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// A message bus of a test's own, and a client of it.
#pragma once

#include <fcntl.h>
#include <signal.h>
#include <sys/prctl.h>
#include <sys/wait.h>
#include <systemd/sd-bus.h>
#include <unistd.h>

#include <array>
#include <functional>
#include <memory>
#include <stdexcept>
#include <string>

#include "plist/Value.h"
#include "support/TemporaryFolder.h"

namespace support {

// A dbus-daemon on a socket in a folder of its own; it ends with the object, or with the test.
class PrivateBus {
 public:
  // The service, if there is one, is started by the first call to its name: a command line with
  // variables in front, to which the bus's own is added.
  explicit PrivateBus(const std::string& service = "") {
    const std::string socket = "unix:path=" + (folder_ / "socket").string();
    if (!service.empty()) {
      folder_.write("services/com.norba.pellorand.morvend.service",
                    "[D-BUS Service]\nName=com.norba.pellorand.morvend\nExec=/usr/bin/env "
                    "DBUS_SYSTEM_BUS_ADDRESS=" +
                        socket + " " + service + "\n");
    }
    folder_.write("bus.conf", "<busconfig><type>session</type><listen>" + socket +
                                  "</listen><servicedir>" + (folder_ / "services").string() +
                                  "</servicedir><auth>EXTERNAL</auth><policy context=\"default\">"
                                  "<allow send_destination=\"*\"/><allow receive_sender=\"*\"/>"
                                  "<allow own=\"*\"/></policy>"
                                  "</busconfig>");
    const std::string configuration = "--config-file=" + (folder_ / "bus.conf").string();
    std::array<int, 2> ready;
    if (::pipe(ready.data()) != 0) throw std::runtime_error("pipe failed");
    const std::string print = "--print-address=" + std::to_string(ready[1]);
    process_ = ::fork();
    if (process_ == 0) {
      ::prctl(PR_SET_PDEATHSIG, SIGKILL);
      ::dup2(::open((folder_ / "log").c_str(), O_WRONLY | O_CREAT, 0600), STDERR_FILENO);
      ::execlp("dbus-daemon", "dbus-daemon", "--nofork", "--nopidfile", configuration.c_str(),
               print.c_str(), nullptr);
      ::_exit(127);
    }
    ::close(ready[1]);
    std::array<char, 512> text;
    const ssize_t length = ::read(ready[0], text.data(), text.size());
    ::close(ready[0]);
    if (length <= 0) throw std::runtime_error("dbus-daemon did not start");
    address_.assign(text.data(), static_cast<std::size_t>(length) - 1);
  }
  ~PrivateBus() { kill(); }
  PrivateBus(const PrivateBus&) = delete;
  PrivateBus& operator=(const PrivateBus&) = delete;

  // What DBUS_SYSTEM_BUS_ADDRESS takes.
  const std::string& address() const { return address_; }

  // From now on the bus takes connections and bytes, but answers nothing.
  void freeze() {
    ::kill(process_, SIGSTOP);
    int status = 0;
    ::waitpid(process_, &status, WUNTRACED);
  }

  void kill() {
    if (process_ <= 0) return;
    ::kill(process_, SIGKILL);
    ::waitpid(process_, nullptr, 0);
    process_ = -1;
  }

 private:
  TemporaryFolder folder_;
  pid_t process_ = -1;
  std::string address_;
};

// A client with a connection of its own. Whatever fails throws.
class BusClient {
 public:
  static constexpr char kService[] = "com.norba.pellorand.morvend";
  static constexpr char kPath[] = "/com/norba/pellorand/morvend";

  explicit BusClient(const std::string& address) {
    sd_bus* bus = nullptr;
    check(sd_bus_new(&bus));
    bus_.reset(bus);
    check(sd_bus_set_address(bus, address.c_str()));
    check(sd_bus_set_bus_client(bus, 1));
    check(sd_bus_start(bus));
    settle();
  }

  sd_bus* bus() const { return bus_.get(); }

  // Sends a message to the service: integers as x, texts as s, data as ay, arrays, which hold
  // dictionaries, as aa{sv}.
  void send(const plist::Dictionary& message) {
    sendCall([&](sd_bus_message* call) { append(call, message); });
  }

  // Sends a call of Message with a body of the caller's making. A call that expects an answer is
  // given to the handler with it.
  void sendCall(const std::function<void(sd_bus_message*)>& makeBody,
                sd_bus_message_handler_t onAnswer = nullptr, void* context = nullptr) {
    sd_bus_message* call = nullptr;
    check(sd_bus_message_new_method_call(bus(), &call, kService, kPath, kService, "Message"));
    const std::unique_ptr<sd_bus_message, decltype(&sd_bus_message_unref)> owned(
        call, sd_bus_message_unref);
    makeBody(call);
    if (onAnswer != nullptr) {
      check(sd_bus_call_async(bus(), nullptr, call, onAnswer, context, 0));
    } else {
      check(sd_bus_message_set_expect_reply(call, 0));
      check(sd_bus_send(bus(), call, nullptr));
    }
    check(sd_bus_flush(bus()));
  }

  // Asks the bus something and waits for the answer: what was sent before has reached its
  // receiver's queue, and what was sent to this client before has been handled.
  void settle() {
    check(sd_bus_call_method(bus(), "org.freedesktop.DBus", "/org/freedesktop/DBus",
                             "org.freedesktop.DBus", "GetId", nullptr, nullptr, nullptr));
    while (check(sd_bus_process(bus(), nullptr)) > 0) {
    }
  }

  bool serviceHasOwner() {
    sd_bus_message* answer = nullptr;
    check(sd_bus_call_method(bus(), "org.freedesktop.DBus", "/org/freedesktop/DBus",
                             "org.freedesktop.DBus", "NameHasOwner", nullptr, &answer, "s",
                             kService));
    int owned = 0;
    check(sd_bus_message_read(answer, "b", &owned));
    sd_bus_message_unref(answer);
    return owned != 0;
  }

  // The process that owns the service's name.
  pid_t serviceProcess() {
    sd_bus_creds* owner = nullptr;
    check(sd_bus_get_name_creds(bus(), kService, SD_BUS_CREDS_PID, &owner));
    pid_t process = 0;
    check(sd_bus_creds_get_pid(owner, &process));
    sd_bus_creds_unref(owner);
    return process;
  }

  static void append(sd_bus_message* call, const plist::Dictionary& dictionary) {
    check(sd_bus_message_open_container(call, 'a', "{sv}"));
    for (const auto& entry : dictionary) {
      check(sd_bus_message_open_container(call, 'e', "sv"));
      check(sd_bus_message_append(call, "s", entry.key.c_str()));
      append(call, entry.value);
      check(sd_bus_message_close_container(call));
    }
    check(sd_bus_message_close_container(call));
  }

 private:
  static int check(int result) {
    if (result < 0) throw std::runtime_error("bus client: error " + std::to_string(-result));
    return result;
  }

  static void append(sd_bus_message* call, const plist::Value& value) {
    if (const auto* text = value.as<std::string>()) {
      check(sd_bus_message_append(call, "v", "s", text->c_str()));
    } else if (const auto* number = value.as<plist::Number>()) {
      check(sd_bus_message_append(call, "v", "x", number->int64Value()));
    } else if (const auto* data = value.as<plist::Data>()) {
      check(sd_bus_message_open_container(call, 'v', "ay"));
      check(sd_bus_message_append_array(call, 'y', data->data(), data->size()));
      check(sd_bus_message_close_container(call));
    } else {
      check(sd_bus_message_open_container(call, 'v', "aa{sv}"));
      check(sd_bus_message_open_container(call, 'a', "a{sv}"));
      for (const auto& element : *value.as<plist::Array>()) {
        append(call, *element.as<plist::Dictionary>());
      }
      check(sd_bus_message_close_container(call));
      check(sd_bus_message_close_container(call));
    }
  }

  std::unique_ptr<sd_bus, decltype(&sd_bus_flush_close_unref)> bus_{nullptr,
                                                                    sd_bus_flush_close_unref};
};

}  // namespace support
