// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/bus/Bus.h"

#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <cstdint>
#include <iterator>
#include <thread>

#include "platform/testing/RecordingLog.h"
#include "support/PrivateBus.h"

namespace {

using namespace platform;
using namespace std::chrono_literals;
using host::Bus;
using support::BusClient;
using support::PrivateBus;
using Result = EventLoop::RunResult;
using Clock = std::chrono::steady_clock;

constexpr char kService[] = "com.norba.pellorand.morvend";

double secondsOf(const std::function<void()>& work) {
  const auto start = Clock::now();
  work();
  return std::chrono::duration<double>(Clock::now() - start).count();
}

// What a service got: messages, and the other events.
struct Service {
  explicit Service(Bus& bus) : listener(bus.listen(kService)) {
    if (listener == nullptr) return;
    listener->start([this](const plist::Dictionary* message) {
      if (message == nullptr) {
        ++otherEvents;
        return;
      }
      messages.push_back(*message);
      if (onMessage) onMessage();
    });
  }

  std::unique_ptr<NamedServiceListener> listener;
  std::vector<plist::Dictionary> messages;
  std::function<void()> onMessage;
  int otherEvents = 0;
};

plist::Dictionary operation(std::int64_t code) { return {{"operation", code}}; }

class BusTest : public testing::Test {
 protected:
  BusTest() { ::setenv("DBUS_SYSTEM_BUS_ADDRESS", daemon.address().c_str(), 1); }
  ~BusTest() override { ::unsetenv("DBUS_SYSTEM_BUS_ADDRESS"); }

  PrivateBus daemon;
  fakes::RecordingLog log{LogLevel::standard};
};

TEST_F(BusTest, MessagesOfSeveralClientsComeOneARunAndWhole) {
  Bus bus(log);
  Service service(bus);
  ASSERT_NE(service.listener, nullptr);
  BusClient first(daemon.address()), second(daemon.address());
  const plist::Dictionary delivery{
      {"operation", std::int64_t{2}},
      {"app_data",
       plist::Array{plist::Dictionary{{"uuid", plist::Data(16, 0xAB)}}, plist::Dictionary{}}}};
  first.send(operation(0));
  first.settle();
  second.send(delivery);
  {
    BusClient gone(daemon.address());  // before its message is read
    gone.send(operation(1));
    gone.settle();
  }
  for (std::size_t i = 1; i <= 3; ++i) {
    EXPECT_EQ(bus.run(10.0, true), Result::handledSource);
    EXPECT_EQ(service.messages.size(), i);
  }
  EXPECT_EQ(bus.run(0.0, true), Result::timedOut);
  EXPECT_EQ(service.messages, (std::vector{operation(0), delivery, operation(1)}));
  EXPECT_TRUE(log.lines().empty());
}

TEST_F(BusTest, WhatIsQueuedWhenTheTimeIsOutIsServedBeforeTheNameGoes) {
  Bus bus(log);
  Service service(bus);
  BusClient client(daemon.address());
  for (int i = 0; i < 5; ++i) client.send(operation(i));
  client.settle();
  // A handler that outlasts its run ends the run as timed out; nothing may get lost behind it.
  service.onMessage = [] {
    const auto end = Clock::now() + 2ms;
    while (Clock::now() < end) {
    }
  };
  Result result = bus.run(0.001, true);
  EXPECT_EQ(result, Result::handledSource);
  EXPECT_TRUE(client.serviceHasOwner()) << "the name was not taken again";
  while (result == Result::handledSource) result = bus.run(0.001, true);
  EXPECT_EQ(service.messages.size(), 5u);
  EXPECT_FALSE(client.serviceHasOwner()) << "the name is still owned after the time-out";
}

TEST_F(BusTest, NoMessageSentWhileTheNameWasOwnedIsLost) {
  constexpr int kMessages = 300;
  std::atomic<bool> done = false;
  int refused = 0;
  std::thread sender([&] {
    BusClient client(daemon.address());
    for (int i = 0; i < kMessages; ++i) {
      // The bus says that it refuses a message (nobody owns the name, or too many answers are still
      // to come), and otherwise when a receiver goes without having answered.
      client.sendCall([](sd_bus_message* call) { BusClient::append(call, operation(1)); },
                      [](sd_bus_message* answer, void* count, sd_bus_error*) {
                        *static_cast<int*>(count) +=
                            !sd_bus_message_is_method_error(answer, SD_BUS_ERROR_NO_REPLY);
                        return 1;
                      },
                      &refused);
      for (int pause = 0; pause < i % 7; ++pause) client.settle();
    }
    client.settle();
    done = true;
  });
  int delivered = 0;
  int exits = 0;
  while (!done) {
    Bus bus(log);  // a process of its own, as far as the bus can tell
    Service service(bus);
    ASSERT_NE(service.listener, nullptr);
    while (bus.run(0.0002, true) != Result::timedOut) {
    }
    delivered += static_cast<int>(service.messages.size());
    ++exits;
  }
  sender.join();
  EXPECT_EQ(delivered + refused, kMessages) << delivered << " delivered, " << exits << " exits";
}

// Each is a handled source, which begins the wait anew; only a message is more.
TEST_F(BusTest, NothingIsAnsweredNotEvenANonsensicalCall) {
  Bus bus(log);
  Service service(bus);
  BusClient client(daemon.address());
  int answers = 0, pongs = 0;
  const auto count = [](sd_bus_message*, void* counter, sd_bus_error*) {
    ++*static_cast<int*>(counter);
    return 1;
  };
  client.sendCall([](sd_bus_message* call) { BusClient::append(call, operation(3)); }, count,
                  &answers);
  client.sendCall([](sd_bus_message* call) { sd_bus_message_append(call, "su", "nonsense", 7u); },
                  count, &answers);
  client.sendCall([](sd_bus_message*) {}, count, &answers);
  sd_bus_call_method_async(client.bus(), nullptr, kService, BusClient::kPath,
                           "org.freedesktop.DBus.Peer", "Ping", count, &pongs, nullptr);
  client.settle();
  for (int call = 0; call < 4; ++call)
    EXPECT_EQ(bus.run(10.0, true), Result::handledSource) << call;
  EXPECT_EQ(bus.run(0.0, true), Result::timedOut);
  client.settle();
  EXPECT_EQ(service.messages.size(), 1u);
  EXPECT_EQ(pongs, 1);
  EXPECT_EQ(answers, 0);
}

TEST_F(BusTest, AFloodIsCutToItsLimitsAndSaidOnce) {
  Bus bus(log);
  Service service(bus);
  BusClient client(daemon.address());
  plist::Array applications(10000, plist::Dictionary{{"bundle_id", "com.example.application"}});
  client.send({{"app_data", std::move(applications)}, {"operation", std::int64_t{2}}});
  client.settle();
  EXPECT_EQ(bus.run(10.0, true), Result::handledSource);
  ASSERT_EQ(service.messages.size(), 1u);
  EXPECT_EQ(service.messages[0].array("app_data")->size(), 4096u);
  EXPECT_EQ(service.messages[0].number("operation")->int64Value(), 2);
  ASSERT_EQ(log.lines().size(), 1u);
  EXPECT_EQ(log.count("error: dropped 5904 values of a message from :"), 1);
}

TEST_F(BusTest, ATakenNameCantBeRegistered) {
  Bus first(log), second(log);
  Service owner(first);
  EXPECT_NE(owner.listener, nullptr);
  EXPECT_EQ(second.listen(kService), nullptr);
  EXPECT_EQ(first.listen(kService), nullptr);
  EXPECT_EQ(log.count("error: message bus: can't take the name of the service: File exists"), 1);
  owner.listener.reset();
  BusClient client(daemon.address());
  client.settle();
  EXPECT_NE(second.listen(kService), nullptr) << "a listener that is gone still has the name";
}

TEST_F(BusTest, ANotificationIsASignalAndWhatCantBeOneIsDropped) {
  BusClient client(daemon.address());
  std::vector<std::string> signals;
  ASSERT_GE(sd_bus_match_signal(
                client.bus(), nullptr, nullptr, BusClient::kPath, nullptr, nullptr,
                [](sd_bus_message* signal, void* list, sd_bus_error*) {
                  static_cast<std::vector<std::string>*>(list)->push_back(
                      std::string(sd_bus_message_get_interface(signal)) + " " +
                      sd_bus_message_get_member(signal));
                  return 1;
                },
                &signals),
            0);
  {
    Bus bus(log);
    bus.postNotification("com.norba.pellorand.morvend.logging");
    bus.postNotification("com.norba.da.tasking_changed");
    const std::string_view wrong[] = {
        "",     "logging", "com.logging", ".logging",
        "a.b.", "a..b.c",  "a.b.c d",     std::string_view("a.b.c\0d", 7)};
    for (const auto name : wrong) bus.postNotification(name);
    EXPECT_EQ(log.count("error: dropped the notification"), std::ssize(wrong));
  }
  client.settle();
  EXPECT_EQ(signals, (std::vector<std::string>{"com.norba.pellorand.morvend logging",
                                               "com.norba.da tasking_changed"}));
}

TEST_F(BusTest, ALostConnectionLeavesAQuietLoop) {
  Bus bus(log);
  Service service(bus);
  daemon.kill();
  const std::clock_t before = std::clock();
  EXPECT_GE(secondsOf([&] { EXPECT_EQ(bus.run(0.2, true), Result::timedOut); }), 0.2);
  EXPECT_LT(std::clock() - before, CLOCKS_PER_SEC / 10) << "the loop spins";
  EXPECT_EQ(service.otherEvents, 1);
  EXPECT_EQ(log.count("error: message bus: the connection is lost"), 1);
  bus.postNotification("com.norba.pellorand.morvend.logging");
}

TEST_F(BusTest, ABusThatStopsAnsweringIsGivenUp) {
  daemon.freeze();
  EXPECT_LT(secondsOf([&] {
              Bus bus(log, 20ms);
              EXPECT_EQ(bus.listen(kService), nullptr);
              bus.postNotification("com.norba.pellorand.morvend.logging");
              EXPECT_EQ(bus.run(0.01, true), Result::timedOut);
            }),
            2.0);
  EXPECT_EQ(log.count("error: message bus: can't connect: Connection timed out"), 1);
}

TEST_F(BusTest, ABusThatFallsSilentLaterIsGivenUpToo) {
  EXPECT_LT(secondsOf([&] {
              Bus bus(log, 20ms);
              Service service(bus);
              ASSERT_NE(service.listener, nullptr);
              daemon.freeze();
              for (int i = 0; i < 1000; ++i) bus.postNotification("a.b." + std::string(200, 'c'));
              EXPECT_EQ(bus.run(0.01, true), Result::timedOut);
            }),
            2.0);
  EXPECT_EQ(
      log.count("error: message bus: can't release the name of the service: Connection timed"), 1);
}

TEST(BusWithoutABus, TheLoopWaitsForItsTimeAndNothingIsSaid) {
  ::setenv("DBUS_SYSTEM_BUS_ADDRESS", "unix:path=/nonexistent/socket", 1);
  fakes::RecordingLog log(LogLevel::standard);
  Bus bus(log);
  EXPECT_EQ(bus.listen(kService), nullptr);
  bus.postNotification("com.norba.pellorand.morvend.logging");
  for (const double seconds : {0.0, -1.0, 0.05}) {
    EXPECT_GE(secondsOf([&] { EXPECT_EQ(bus.run(seconds, true), Result::timedOut); }), seconds);
  }
  EXPECT_TRUE(log.lines().empty());
  ::unsetenv("DBUS_SYSTEM_BUS_ADDRESS");
}

}  // namespace
