// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/outbox/EventSink.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstddef>
#include <filesystem>
#include <future>

#include "HostServices.h"

namespace host {
namespace {

constexpr char kEvents[] = "var/spool/morvend/events.jsonl";

struct EventSinkTest : testing::Test, support::HostServices {
  PendingRun run;
  EventSink sink{root, clock, log, run};

  static plist::Dictionary nothing() { return {}; }
  void send(const char* event = "event") {
    EXPECT_TRUE(sink.EventraSendEventLazy(event, nothing));
    sink.drain();
  }
  std::ptrdiff_t lines() const {
    const std::string text = folder.read(kEvents);
    return std::count(text.begin(), text.end(), '\n');
  }
};

// A process may be killed anywhere between the record of the day and the last of its lines.
TEST_F(EventSinkTest, WhatWaitsIsAppendedOnceWhereverTheLastTimeEnded) {
  const auto leavesDay5 = [](const auto& day) { return day == 5; };
  const struct {
    const char* pending;  // "2\n33\n" waits under this name, the file held "1\n" before
    const char* stands;
    const char* becomes;
  } rows[] = {{".pending-5.events.jsonl", "1\n", "1\n2\n33\n"},
              {".pending-5.events.jsonl", "1\nto", "1\n2\n33\n"},
              {".pending-6.events.jsonl", "1\n", "1\n"},
              {".pending-run.events.jsonl", "1\n", "1\n"},
              {".publishing-2.events.jsonl", "1\n", "1\n2\n33\n"},
              {".publishing-2.events.jsonl", "1\n2\n3", "1\n2\n33\n"},
              {".publishing-2.events.jsonl", "1\n2\n33\n", "1\n2\n33\n"},
              {".publishing-2.events.jsonl", "1\n2\n33\n4\n", "1\n2\n33\n4\n"},
              {".publishing-2.events.jsonl", "1\n2\n4\n", "1\n2\n4\n33\n"},
              {".publishing-2.events.jsonl", "1\n22\n", "1\n22\n2\n33\n"}};
  for (const auto& [pending, stands, becomes] : rows) {
    const std::string waiting = std::string("var/spool/morvend/") + pending;
    folder.write(waiting, "2\n33\n");
    folder.write(kEvents, stands);
    EXPECT_TRUE(sink.settle(leavesDay5));
    EXPECT_EQ(folder.read(kEvents), becomes) << pending << stands;
    EXPECT_FALSE(std::filesystem::exists(folder / waiting.c_str())) << pending;
  }
}

TEST_F(EventSinkTest, LinesStandInTheOrderAndWithTheTimesOfSending) {
  std::promise<void> go;
  sink.EventraSendEventLazy("first", [wait = go.get_future().share()] {
    wait.wait();
    return plist::Dictionary{{"a", 1}};
  });
  clock.seconds = clock.seconds + 1;
  sink.EventraSendEventLazy("second", nothing);
  clock.seconds = 0;
  go.set_value();
  sink.drain();
  const std::string expected =
      "{\"event\": \"first\", \"time\": \"2026-11-22T04:00:00Z\", \"payload\": {\"a\": 1}}\n"
      "{\"event\": \"second\", \"time\": \"2026-11-22T04:00:01Z\", \"payload\": {}}\n";
  EXPECT_EQ(folder.read(kEvents), expected);
  send();
  EXPECT_EQ(lines(), 3);
}

TEST_F(EventSinkTest, AFullFileMakesRoomAndTheOldestOfFourIsDropped) {
  const std::string name = kEvents;
  for (int round = 0; round < 6; ++round) {
    folder.write(kEvents, std::string(EventSink::kMaxFile - 1, 'x') + '\n');
    send();
    send();
    EXPECT_EQ(lines(), 2) << round;
    for (int number = 1; number <= 5; ++number) {
      EXPECT_EQ(std::filesystem::exists(folder / (name + "." + std::to_string(number))),
                number <= std::min(round + 1, EventSink::kKept));
    }
  }
  EXPECT_EQ(log.count("default: Dropped the events of " + root.hostPath(name + ".4")), 2);
  EXPECT_EQ(log.lines().size(), 2u);
}

TEST_F(EventSinkTest, OnlyUsedEventsAreProduced) {
  folder.write("device/analytics.plist", xml({{"UsedEvents", plist::Array{"used", 7}}}));
  const auto never = [] {
    ADD_FAILURE();
    return plist::Dictionary{};
  };
  EXPECT_FALSE(sink.EventraIsEventUsed("unused"));
  EXPECT_FALSE(sink.EventraSendEventLazy("unused", never));
  EXPECT_TRUE(sink.offersLazySend());
  send("used");
  EXPECT_EQ(lines(), 1);
  folder.write("device/analytics.plist", xml({{"Available", false}}));
  EventSink absent(root, clock, log, run);
  EXPECT_FALSE(absent.offersLazySend());
  EXPECT_TRUE(absent.EventraIsEventUsed("used"));
  EXPECT_FALSE(absent.EventraSendEventLazy("used", never));
}

TEST_F(EventSinkTest, ABrokenConfigurationIsSaidOnceAndLeavesEveryEventUsed) {
  folder.write("device/analytics.plist", "garbage");
  EXPECT_TRUE(sink.EventraIsEventUsed("any"));
  EXPECT_TRUE(sink.offersLazySend());
  EXPECT_EQ(log.count("error: " + root.hostPath("device/analytics.plist: ")), 1);
}

TEST_F(EventSinkTest, TheQueueIsBounded) {
  std::promise<void> begun, go;
  sink.EventraSendEventLazy("blocking", [&begun, wait = go.get_future().share()] {
    begun.set_value();
    wait.wait();
    return plist::Dictionary{};
  });
  begun.get_future().wait();
  std::size_t queued = 0;
  while (queued <= EventSink::kMaxQueued && sink.EventraSendEventLazy("event", nothing)) {
    ++queued;
  }
  EXPECT_EQ(queued, EventSink::kMaxQueued);
  go.set_value();
  sink.drain();
  EXPECT_EQ(lines(), static_cast<std::ptrdiff_t>(queued) + 1);
}

TEST_F(EventSinkTest, NoEventIsLostBetweenSendersProducersAndDrains) {
  constexpr int kSenders = 4, kEach = 500;
  std::vector<std::thread> senders;
  for (int i = 0; i < kSenders; ++i) {
    senders.emplace_back([this] {
      for (int n = 0; n < kEach; ++n) {
        sink.EventraSendEventLazy("outer", [this] {
          sink.EventraSendEventLazy("inner", nothing);
          return plist::Dictionary{};
        });
      }
    });
  }
  for (int n = 0; n < 50; ++n) sink.drain();
  for (std::thread& sender : senders) sender.join();
  sink.drain();
  EXPECT_EQ(lines(), 2 * kSenders * kEach);
}

TEST_F(EventSinkTest, EventsThatCannotBeWrittenAreDroppedWithOneLine) {
  const std::string name = kEvents, full(EventSink::kMaxFile, '\n');
  const struct {
    std::vector<const char*> folders;
    bool secondName;
    std::string line;
  } rows[] = {{{""}, false, name + ": not a regular file"},
              {{}, true, name + ": a file with several names"},
              {{".1", ".2", ".3", ".4"}, false, name + ".1: not a regular file"}};
  for (const auto& row : rows) {
    log.clear();
    std::filesystem::remove_all(folder / "var");
    if (row.folders.size() != 1) folder.write(name, row.secondName ? "one\n" : full);
    for (const char* end : row.folders) std::filesystem::create_directories(folder / (name + end));
    if (row.secondName) std::filesystem::create_hard_link(folder / name, folder / "other");
    EventSink failing(root, clock, log, run);
    for (int n = 0; n < 3; ++n) {
      EXPECT_TRUE(failing.EventraSendEventLazy("event", nothing));
      failing.drain();
    }
    EXPECT_EQ(log.count("error: Could not write " + root.hostPath(row.line)), 1) << row.line;
    EXPECT_EQ(log.lines().size(), 1u);
  }
  EXPECT_EQ(folder.read("other"), "one\n");
  // What a number is taken by is passed over as long as another one is left.
  std::filesystem::remove(folder / (name + ".3"));
  send();
  EXPECT_EQ(lines(), 1);
  EXPECT_TRUE(folder.read(name + ".3") == full);
  EXPECT_EQ(log.count("error: Passed over " + root.hostPath(name)), 2);
}

}  // namespace
}  // namespace host
