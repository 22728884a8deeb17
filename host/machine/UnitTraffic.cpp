// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/machine/UnitTraffic.h"

#include <systemd/sd-bus.h>

#include <cerrno>
#include <chrono>
#include <cstddef>
#include <cstdint>
#include <limits>
#include <memory>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "host/files/SystemError.h"

namespace host::machine {

namespace {

constexpr std::size_t kMaxUnits = 4096;
constexpr std::size_t kMaxUnitName = 255;
constexpr std::uint64_t kNotAccounted = std::numeric_limits<std::uint64_t>::max();

constexpr char kSystemd[] = "org.freedesktop.systemd1";
constexpr char kUnit[] = "org.freedesktop.systemd1.Unit";

// The kinds of units whose traffic is counted, and the interfaces that tell of it.
constexpr struct {
  const char *suffix, *pattern, *interface;
} kKinds[] = {{".service", "*.service", "org.freedesktop.systemd1.Service"},
              {".scope", "*.scope", "org.freedesktop.systemd1.Scope"},
              {".socket", "*.socket", "org.freedesktop.systemd1.Socket"}};

struct CloseBus {
  void operator()(sd_bus* bus) const { sd_bus_close_unref(bus); }
};
struct UnrefMessage {
  void operator()(sd_bus_message* message) const { sd_bus_message_unref(message); }
};
using Message = std::unique_ptr<sd_bus_message, UnrefMessage>;

struct Unit {
  std::string name, path;
  const char* interface;
};

// A conversation with systemd that ends in time. Its calls return error numbers, negative.
class Conversation {
 public:
  explicit Conversation(std::chrono::milliseconds patience) : end_(Clock::now() + patience) {}

  // Drives the library ourselves: left alone, it waits for a silent bus for much longer.
  int connect() {
    sd_bus* bus = nullptr;
    if (const int result = sd_bus_open_system(&bus); result < 0) return result;
    bus_.reset(bus);
    while (sd_bus_is_ready(bus) <= 0) {
      if (microsecondsLeft() == 0) return -ETIMEDOUT;
      int result = sd_bus_process(bus, nullptr);
      if (result == 0) result = sd_bus_wait(bus, microsecondsLeft());
      if (result < 0 && result != -EINTR) return result;
    }
    return 0;
  }

  int listUnits(std::vector<Unit>& units) {
    sd_bus_message* made = nullptr;
    int result =
        sd_bus_message_new_method_call(bus_.get(), &made, kSystemd, "/org/freedesktop/systemd1",
                                       "org.freedesktop.systemd1.Manager", "ListUnitsByPatterns");
    const Message call(made);
    if (result >= 0) result = sd_bus_message_append(made, "as", 2, "active", "reloading");
    if (result >= 0) result = sd_bus_message_open_container(made, 'a', "s");
    for (const auto& kind : kKinds) {
      if (result >= 0) result = sd_bus_message_append(made, "s", kind.pattern);
    }
    if (result >= 0) result = sd_bus_message_close_container(made);
    const Message answer = result < 0 ? nullptr : callFor(made, result);
    if (result >= 0) result = sd_bus_message_enter_container(answer.get(), 'a', "(ssssssouso)");
    const char *name = nullptr, *path = nullptr, *skipped = nullptr;
    std::uint32_t job = 0;
    while (result >= 0 && units.size() < kMaxUnits &&
           (result = sd_bus_message_read(answer.get(), "(ssssssouso)", &name, &skipped, &skipped,
                                         &skipped, &skipped, &skipped, &path, &job, &skipped,
                                         &skipped)) > 0) {
      const std::string unit = name;
      for (const auto& kind : kKinds) {
        if (unit.ends_with(kind.suffix) && unit.size() <= kMaxUnitName) {
          units.push_back({unit, path, kind.interface});
        }
      }
    }
    return result;
  }

  // A property that is an unsigned 64-bit number.
  int property(const Unit& unit, const char* interface, const char* name, std::uint64_t& value) {
    sd_bus_message* made = nullptr;
    int result = sd_bus_message_new_method_call(bus_.get(), &made, kSystemd, unit.path.c_str(),
                                                "org.freedesktop.DBus.Properties", "Get");
    const Message call(made);
    if (result >= 0) result = sd_bus_message_append(made, "ss", interface, name);
    const Message answer = result < 0 ? nullptr : callFor(made, result);
    if (result >= 0) result = sd_bus_message_read(answer.get(), "v", "t", &value);
    return result;
  }

 private:
  using Clock = std::chrono::steady_clock;

  std::uint64_t microsecondsLeft() const {
    const auto left = std::chrono::ceil<std::chrono::microseconds>(end_ - Clock::now()).count();
    return left > 0 ? static_cast<std::uint64_t>(left) : 0;
  }

  Message callFor(sd_bus_message* call, int& result) {
    sd_bus_message* answer = nullptr;
    const std::uint64_t left = microsecondsLeft();  // 0 would be the library's own patience
    result = left == 0 ? -ETIMEDOUT : sd_bus_call(bus_.get(), call, left, nullptr, &answer);
    return Message(answer);
  }

  std::unique_ptr<sd_bus, CloseBus> bus_;
  const Clock::time_point end_;
};

// The connection has ended, or no time is left: nothing that is asked afterwards is answered.
bool isLost(int result) {
  return result == -ETIMEDOUT || result == -ENOTCONN || result == -ECONNRESET || result == -EPIPE;
}

// What a unit has sent and received, of one run of it; none when it isn't accounted, or is gone.
base::Result<std::optional<UnitTraffic>> trafficOf(Conversation& systemd, const Unit& unit) {
  std::uint64_t received = kNotAccounted, sent = kNotAccounted;
  const auto ask = [&](const char* interface, const char* name, std::uint64_t& value) {
    return systemd.property(unit, interface, name, value);
  };
  int result = ask(unit.interface, "IPIngressBytes", received);
  for (int tries = 3; result >= 0 && received != kNotAccounted && tries > 0; --tries) {
    std::uint64_t since = 0, sinceStill = 0;
    result = ask(kUnit, "ActiveEnterTimestamp", since);
    if (result >= 0) result = ask(unit.interface, "IPIngressBytes", received);
    if (result >= 0) result = ask(unit.interface, "IPEgressBytes", sent);
    if (result >= 0) result = ask(kUnit, "ActiveEnterTimestamp", sinceStill);
    if (result < 0 || received == kNotAccounted || sent == kNotAccounted || since == 0) break;
    if (since == sinceStill) {
      return std::optional(
          UnitTraffic{unit.name, static_cast<double>(since) / 1e6, received, sent});
    }
  }
  if (isLost(result)) return systemError(-result);
  return std::optional<UnitTraffic>();
}

}  // namespace

base::Result<std::vector<UnitTraffic>> unitTraffic(std::chrono::milliseconds patience) {
  Conversation systemd(patience);
  std::vector<UnitTraffic> traffic;
  std::vector<Unit> units;
  int result = systemd.connect();
  if (result >= 0) result = systemd.listUnits(units);
  // No bus, or nobody there who is called systemd.
  if (result == -ENOENT || result == -ECONNREFUSED || result == -EHOSTUNREACH) return traffic;
  if (result < 0) return systemError(-result);
  for (const Unit& unit : units) {
    auto found = trafficOf(systemd, unit);
    if (!found) return found.error();
    if (*found) traffic.push_back(**std::move(found));
  }
  return traffic;
}

}  // namespace host::machine
