// A whole day, with a fault at each of its state-changing calls.

#include <gtest/gtest.h>
#include <signal.h>

#include <algorithm>
#include <filesystem>

#include "end_to_end/Device.h"

namespace end_to_end {
namespace {

constexpr char kGateRecord[] = "LastCrashLogSerializationDateInDaysSince1970";

// What must hold once a run without a fault has followed one with a fault.
void checkDevice(const Device& before, const Device& device, const faults::Outcome& faulty,
                 const std::string& what) {
  EXPECT_EQ(device.history(), before.history()) << what;
  EXPECT_EQ(device.record(kGateRecord), Value(device.today() - 1)) << what;
  EXPECT_EQ(device.record("TaskingID"), Value("T1")) << what;

  // Submitted whole, once; twice when the run was killed after that; not at all only when the run
  // said so.
  const auto logs = device.dailyLogs();
  const bool lost = faulty.standardError.find("Failed to write pellorand log") != std::string::npos;
  EXPECT_TRUE(logs.size() == 1 || (lost && logs.empty()) ||
              (faulty.signal != 0 && logs.size() == 2))
      << what << ": " << logs.size() << " logs\n"
      << faulty.standardError;
  const Dictionary expected = device.expectedSections();
  for (const Dictionary& log : logs) {
    for (const auto& section : expected) {
      const Value* found = log.find(section.key);
      ASSERT_NE(found, nullptr) << what << ": " << section.key;
      EXPECT_EQ(*found, section.value) << what << ": " << section.key;
    }
  }

  // A key that isn't recorded is missing only when the run said so, and nothing is recorded twice,
  // but for data usage when the run was killed before its baseline was kept.
  Lines expectedRows{"DiskUsageUserBlocksFree 3", "DiskUsageUserTotalBlocks 5",
                     "velquist.channel 7", "wifiInKB.com.norba.process 2"};
  const bool unrecorded =
      faulty.standardError.find("Could not record counters") != std::string::npos;
  for (const std::string& row : device.recorded()) {
    const auto found = std::find_if(expectedRows.begin(), expectedRows.end(),
                                    [&](const std::string& end) { return row.ends_with(end); });
    const bool twice = faulty.signal != 0 && row.ends_with("wifiInKB.com.norba.process 4");
    EXPECT_TRUE(found != expectedRows.end() || twice) << what << ": " << row;
    if (found != expectedRows.end()) {
      expectedRows.erase(found);
    } else {
      expectedRows.pop_back();
    }
  }
  EXPECT_TRUE(expectedRows.empty() || unrecorded) << what << ": " << expectedRows.size();

  // No torn file, no broken preference.
  for (const auto& entry : std::filesystem::recursive_directory_iterator(device.root().path())) {
    const std::string name = entry.path().filename();
    const std::string path = entry.path().lexically_relative(device.root().path());
    EXPECT_FALSE(name.ends_with(".corrupt")) << what << ": " << path;
    if (name.ends_with(".plist")) {
      EXPECT_TRUE(device.readPropertyList(path)) << what << ": " << path;
    }
    if (name.ends_with(".jsonl")) {
      const std::string text = device.root().read(path);
      EXPECT_TRUE(text.empty() || text.ends_with("}\n")) << what << ": " << path;
    }
  }

  // The dumped and the rolled logs are there, wherever the two runs have brought them.
  std::string structured, rolled;
  int eccEvents = 0;
  for (const char* folder : {kSubmitted, "var/spool/morvend/structured"}) {
    for (const std::string& name : device.names(folder)) {
      if (!name.ends_with(".jsonl")) continue;
      const std::string text = device.root().read(std::string(folder) + "/" + name);
      if (text.starts_with("{\"type\": 172, ")) {
        eccEvents += static_cast<int>(std::count(text.begin(), text.end(), '\n'));
      } else {
        structured += text;
      }
    }
  }
  EXPECT_LE(eccEvents, 1) << what;
  EXPECT_EQ(structured, "{\"type\": 1}\n") << what;
  for (const std::string& name : device.names("var/log/servita")) {
    rolled += device.root().read("var/log/servita/" + name);
  }
  EXPECT_EQ(rolled, "new\nold\n") << what;
}

TEST(Faults, CompletesTheDayAfterAFaultAtAnyCallOfARun) {
  if (!faults::available()) GTEST_SKIP() << faults::kUnavailable;
  Device filled;
  filled.fill();
  Device device;
  device.become(filled);
  const std::size_t calls = device.countCalls("morvend", {"-d"});
  ASSERT_GT(calls, 50u);
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
      checkDevice(filled, device, faulty, what);
      if (HasFailure()) FAIL() << faulty.standardError << "then\n" << next.standardError;
    }
  }
}

// A disk that is full from some moment on, to the end of the run.
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
    EXPECT_EQ(device.history(), filled.history()) << what;
    for (const Dictionary& log : device.dailyLogs()) EXPECT_FALSE(log.empty()) << what;
  }
}

}  // namespace
}  // namespace end_to_end
