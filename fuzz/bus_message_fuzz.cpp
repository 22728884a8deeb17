// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Bus messages with arbitrary bodies: the input follows the header of a call with the body
// signature a{sv}, and comes through a connection as a peer's bytes do.

#include <sys/socket.h>
#include <systemd/sd-bus.h>

#include <array>
#include <cstdint>
#include <cstdlib>
#include <string>
#include <string_view>

#include "host/bus/BusMessage.h"
#include "host/files/Files.h"

namespace {

using namespace host;

void require(bool condition) {
  if (!condition) std::abort();
}

// A connection without a bus: the other end has said beforehand what the handshake asks for.
class Connection {
 public:
  Connection() {
    std::array<int, 2> ends;
    require(::socketpair(AF_UNIX, SOCK_STREAM | SOCK_NONBLOCK, 0, ends.data()) == 0);
    peer_ = ends[1];
    require(static_cast<bool>(
        writeAll(peer_, "DATA\r\nOK 0123456789abcdef0123456789abcdef\r\nAGREE_UNIX_FD\r\n")));
    require(sd_bus_new(&bus_) >= 0 && sd_bus_set_fd(bus_, ends[0], ends[0]) >= 0);
    require(sd_bus_start(bus_) >= 0);
    while (sd_bus_is_ready(bus_) <= 0) require(sd_bus_process(bus_, nullptr) >= 0);
  }
  ~Connection() {
    sd_bus_close_unref(bus_);
    ::close(peer_);
  }

  // The message that the bytes make; null when the library refuses them.
  sd_bus_message* receive(std::string_view bytes) {
    sd_bus_message* message = nullptr;
    while (message == nullptr) {
      const ssize_t sent = bytes.empty() ? 0 : ::write(peer_, bytes.data(), bytes.size());
      if (sent > 0) bytes.remove_prefix(static_cast<std::size_t>(sent));
      const int result = sd_bus_process(bus_, &message);
      if (result < 0 || (result == 0 && sent <= 0)) return nullptr;
    }
    return message;
  }

 private:
  sd_bus* bus_ = nullptr;
  int peer_ = -1;
};

std::string messageWithBody(std::string_view body) {
  std::string bytes = {'l', 1, 1 /* no answer expected */, 1};
  const auto appendWord = [&](std::uint32_t word) {
    for (int shift = 0; shift < 32; shift += 8) bytes.push_back(static_cast<char>(word >> shift));
  };
  const auto appendField = [&](char code, char type, std::string_view value) {
    bytes.resize((bytes.size() + 7) / 8 * 8);
    bytes.append({code, 1, type, 0});
    if (type == 'g') {
      bytes.push_back(static_cast<char>(value.size()));
    } else {
      appendWord(static_cast<std::uint32_t>(value.size()));
    }
    bytes.append(value).push_back('\0');
  };
  appendWord(static_cast<std::uint32_t>(body.size()));
  appendWord(1);  // serial
  appendWord(0);  // length of the fields, below
  appendField(1, 'o', "/o");
  appendField(3, 's', "Message");
  appendField(8, 'g', "a{sv}");
  bytes[12] = static_cast<char>(bytes.size() - 16);
  bytes.resize((bytes.size() + 7) / 8 * 8);
  return bytes.append(body);
}

struct Cost {
  std::size_t values = 0, bytes = 0;

  void add(const plist::Dictionary& dictionary, int depth) {
    require(dictionary.size() <= kMaxElements && depth <= kMaxNesting);
    for (const auto& entry : dictionary) {
      bytes += entry.key.size();
      add(entry.value, depth);
    }
  }
  void add(const plist::Value& value, int depth) {
    ++values;
    if (const auto* text = value.as<std::string>()) bytes += text->size();
    if (const auto* data = value.as<plist::Data>()) bytes += data->size();
    if (const auto* dictionary = value.as<plist::Dictionary>()) add(*dictionary, depth + 1);
    if (const auto* array = value.as<plist::Array>()) {
      require(array->size() <= kMaxElements && depth < kMaxNesting);
      for (const plist::Value& element : *array) add(element, depth + 1);
    }
  }
};

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size) {
  static Connection* connection = new Connection;
  sd_bus_message* message =
      connection->receive(messageWithBody({reinterpret_cast<const char*>(bytes), size}));
  if (message == nullptr) {
    // The connection is closed now.
    delete connection;
    connection = new Connection;
    return 0;
  }
  if (const auto read = readDictionary(message)) {
    Cost cost;
    cost.add(read->dictionary, 1);
    require(cost.values <= kMaxValues && cost.bytes <= kMaxBytes);
  }
  sd_bus_message_unref(message);
  return 0;
}
