// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// A bus message that is read without having been sent.
#pragma once

#include <sys/socket.h>
#include <systemd/sd-bus.h>
#include <unistd.h>

#include <array>
#include <functional>
#include <stdexcept>

namespace support {

class SealedMessage {
 public:
  explicit SealedMessage(const std::function<void(sd_bus_message*)>& makeBody) {
    std::array<int, 2> ends;
    if (::socketpair(AF_UNIX, SOCK_STREAM, 0, ends.data()) != 0 || sd_bus_new(&bus_) < 0 ||
        sd_bus_set_fd(bus_, ends[0], ends[0]) < 0 || sd_bus_start(bus_) < 0 ||
        sd_bus_message_new_method_call(bus_, &message_, nullptr, "/o", nullptr, "Message") < 0) {
      throw std::runtime_error("no message could be made");
    }
    peer_ = ends[1];
    makeBody(message_);
    if (sd_bus_message_seal(message_, 1, 0) < 0) throw std::runtime_error("incomplete message");
  }
  ~SealedMessage() {
    sd_bus_message_unref(message_);
    sd_bus_close_unref(bus_);
    ::close(peer_);
  }
  SealedMessage(const SealedMessage&) = delete;
  SealedMessage& operator=(const SealedMessage&) = delete;

  sd_bus_message* get() const { return message_; }

 private:
  sd_bus* bus_ = nullptr;
  sd_bus_message* message_ = nullptr;
  int peer_ = -1;
};

}  // namespace support
