// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// A whole day, with a fault at each of its state-changing calls.

#include <fcntl.h>
#include <gtest/gtest.h>
#include <signal.h>

#include <algorithm>
#include <chrono>
#include <cstddef>
#include <cstdint>
#include <filesystem>
#include <nlohmann/json.hpp>

#include "base/Text.h"
#include "end_to_end/Device.h"
#include "host/counters/CounterStore.h"
#include "host/files/FileLock.h"
#include "host/process/SystemClock.h"
#include "platform/testing/RecordingLog.h"

namespace end_to_end {
namespace {

constexpr char kGateRecord[] = "LastCrashLogSerializationDateInDaysSince1970";

// How many logs have options.
std::ptrdiff_t optionsOf(const Device& device) {
  return std::ranges::count_if(device.names(kSubmitted), [](const std::string& name) {
    return name.ends_with(".options.plist");
  });
}

std::size_t eventsOf(const Device& device) {
  return linesOf(device.root().read("var/spool/morvend/events.jsonl")).size();
}

// What must hold once a run without a fault has followed one with a fault.
// `clean` has had a run without any.
void checkDevice(const Device& before, const Device& clean, const Device& device,
                 const faults::Outcome& faulty, const std::string& what) {
  const auto said = [&faulty](const char* text) {
    return faulty.standardError.find(text) != std::string::npos;
  };
  EXPECT_EQ(device.history(), before.history()) << what;
  EXPECT_EQ(device.record(kGateRecord), Value(device.today() - 1)) << what;
  EXPECT_EQ(device.record("TaskingID"), Value("T1")) << what;

  // Submitted whole, once, with its options: a single fault neither loses nor doubles it.
  const auto logs = device.dailyLogs();
  EXPECT_EQ(logs.size(), 1u) << what << ": " << logs.size() << " logs\n" << faulty.standardError;
  EXPECT_EQ(optionsOf(device), optionsOf(clean)) << what;
  const Dictionary expected = device.expectedSections();
  for (const Dictionary& log : logs) {
    for (const auto& section : expected) {
      const Value* found = log.find(section.key);
      ASSERT_NE(found, nullptr) << what << ": " << section.key;
      EXPECT_EQ(*found, section.value) << what << ": " << section.key;
    }
  }

  // So is the storage log.
  const Lines storage = device.storageLogs();
  EXPECT_EQ(storage.size(), 1u) << what << ": " << storage.size() << " storage logs";
  for (const std::string& log : storage) {
    EXPECT_TRUE(log.starts_with("System ID: ") && log.ends_with("ValidityList[1]:7\n")) << what;
  }
  EXPECT_TRUE(device.record("SSLastLoggedAt")) << what;
  EXPECT_FALSE(said("were not released")) << what;

  // A key that isn't recorded is missing only when the run said so, and nothing is recorded twice.
  const Lines rows = device.recorded(), expectedRows = clean.recorded();
  EXPECT_TRUE(std::includes(expectedRows.begin(), expectedRows.end(), rows.begin(), rows.end()))
      << what;
  EXPECT_TRUE(rows == expectedRows || said("Could not record counters")) << what;
  constexpr char kBaseline[] = "var/preferences/mobile/com.norba.quenset.morvend.plist";
  if (rows == expectedRows) {
    EXPECT_EQ(device.readPropertyList(kBaseline), clean.readPropertyList(kBaseline)) << what;
  }

  // Nothing waits any longer. No torn file, no broken preference.
  for (const auto& entry : std::filesystem::recursive_directory_iterator(device.root().path())) {
    const std::string name = entry.path().filename();
    const std::string path = entry.path().lexically_relative(device.root().path());
    EXPECT_FALSE(name.ends_with(".corrupt") || name.starts_with(".p")) << what << ": " << path;
    if (name.ends_with(".plist")) {
      EXPECT_TRUE(device.readPropertyList(path)) << what << ": " << path;
    }
    if (name.ends_with(".jsonl")) {
      const std::string text = device.root().read(path);
      EXPECT_TRUE(text.empty() || text.ends_with("}\n")) << what << ": " << path;
      for (const std::string& line : linesOf(text)) {
        EXPECT_TRUE(nlohmann::json::accept(line)) << what << ": " << path << ": " << line;
      }
    }
  }

  // The dumped and the rolled logs are there, wherever the two runs have brought them; what the day
  // says of the device is there once, and so are its events.
  std::string rolled;
  std::ptrdiff_t yesterdays = 0, memoryErrors = 0, lists = 0;
  for (const std::string& line : device.structuredLogs()) {
    yesterdays += line == "{\"type\": 1}";
    memoryErrors += line.starts_with("{\"type\": 172, ");
    lists += line.starts_with("{\"type\": 176, ");
  }
  EXPECT_EQ(yesterdays, 1) << what;
  // A memory error that couldn't be taken is still there for the next day.
  memoryErrors += std::ranges::count(device.names("device/ecc-events"), "1");
  EXPECT_EQ(memoryErrors, 1) << what;
  EXPECT_EQ(lists, 5) << what;
  EXPECT_EQ(eventsOf(device), eventsOf(clean)) << what;
  for (const std::string& name : device.names("var/log/servita")) {
    rolled += device.root().read("var/log/servita/" + name);
  }
  EXPECT_EQ(rolled, "new\nold\n") << what;
}

TEST(Faults, CompletesTheDayAfterAFaultAtAnyCallOfARun) {
  if (!faults::available()) GTEST_SKIP() << faults::kUnavailable;
  Device filled;
  filled.fill();
  Device device, clean;
  clean.become(filled);
  const std::size_t calls = clean.countCalls("morvend", {"-d"});
  ASSERT_GT(calls, 120u) << "is the shim not seeing those of the database library?";
  for (const char* kind : faults::kKinds) {
    for (std::size_t at = 1; at <= calls; ++at) {
      device.become(filled);
      const auto faulty = device.run("morvend", {"-d"}, {.at = at, .kind = kind});
      const std::string what = std::string(kind) + " at call " + std::to_string(at);
      const bool kills = std::string(kind).starts_with("kill");
      // Events are written in one to three calls, so that the last ones may not come to it.
      EXPECT_TRUE(faulty.signal == (kills ? SIGKILL : 0) || at + 4 > calls) << what;
      EXPECT_TRUE(kills || faulty.status == 0) << what;
      const auto next = device.run("morvend", {"-d"});
      EXPECT_EQ(next.status, 0) << what;
      checkDevice(filled, clean, device, faulty, what);
      if (HasFailure()) FAIL() << faulty.standardError << "then\n" << next.standardError;
    }
  }
}

// Whoever writes next records what waits beside the counters database, once, wherever it fails or
// is killed.
TEST(Faults, RecordsOnceWhatWaitsWhicheverCallOfTheNextWriterFails) {
  if (!faults::available()) GTEST_SKIP() << faults::kUnavailable;
  Device waiting;
  const std::int32_t today = waiting.today();
  {
    const host::DeviceRoot root(waiting.root().path());
    host::SystemClock clock;
    platform::fakes::RecordingLog log;
    host::CounterStore store{
        root, clock, log, [] { return "/var/mobile"; }, [] {}, [](std::chrono::milliseconds) {}};
    EXPECT_TRUE(store.set("k", 1, today));
    const auto folder = (waiting.root() / support::kCountersDatabase).parent_path();
    const host::FileDescriptor held(::open(folder.c_str(), O_RDONLY | O_CLOEXEC));
    const auto lock = host::FileLock::take(held.get(), {log, folder});
    for (const std::int64_t amount : {10, 100}) EXPECT_TRUE(store.add("k", amount, today));
  }
  const auto row = [today](int sum) {
    return Lines{std::to_string(today) + base::format(" k %d", sum)};
  };
  Device device;
  device.become(waiting);
  const std::size_t calls = device.countCalls("pelloran", {"add", "k", "1000"});
  ASSERT_GT(calls, 10u);
  for (const char* kind : faults::kKinds) {
    for (std::size_t at = 1; at <= calls; ++at) {
      device.become(waiting);
      const auto faulty = device.run("pelloran", {"add", "k", "1000"}, {.at = at, .kind = kind});
      const std::string what = base::format("%s at call %zu: ", kind, at) + faulty.standardError;
      const Lines rows = device.recorded();
      EXPECT_TRUE(rows == row(1111) || (faulty.status != 0 && rows == row(111))) << what;
      EXPECT_TRUE(faulty.status == 0 || faulty.signal == SIGKILL) << what;
      EXPECT_EQ(device.recorded(), rows) << what;
      EXPECT_FALSE(std::filesystem::exists(device.root() /
                                           (std::string(support::kCountersDatabase) + ".waiting")))
          << what;
    }
  }
}

// A disk that is full from some moment on, to the end of the run: which says at last what it lost.
TEST(Faults, EndsTheRunOnADiskThatStaysFull) {
  if (!faults::available()) GTEST_SKIP() << faults::kUnavailable;
  Device filled;
  filled.fill();
  Device device;
  device.become(filled);
  const std::size_t calls = device.countCalls("morvend", {"-d"});
  for (std::size_t at = 1; at <= calls; at += 3) {
    device.become(filled);
    const auto faulty = device.run("morvend", {"-d"}, {.at = at, .kind = "ENOSPC", .onward = true});
    const std::string what = "full from call " + std::to_string(at) + "\n" + faulty.standardError;
    EXPECT_EQ(faulty.status, 0) << what;
    EXPECT_TRUE(ended(faulty)) << what;
    if (!lastLine(faulty).starts_with("<3>the day is not done: ")) {
      EXPECT_TRUE(device.record(kGateRecord)) << what;
      // What couldn't leave any more waits for the next run.
      if (device.dailyLogs().empty()) device.run("morvend", {"-d"});
      EXPECT_EQ(device.dailyLogs().size(), 1u) << what;
    }
    EXPECT_EQ(device.history(), filled.history()) << what;
    for (const Dictionary& log : device.dailyLogs()) EXPECT_FALSE(log.empty()) << what;
  }
}

}  // namespace
}  // namespace end_to_end
