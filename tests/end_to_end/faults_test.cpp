// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// A whole day, with a fault at each of its calls of a kind.

#include <fcntl.h>
#include <gtest/gtest.h>
#include <signal.h>

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <filesystem>

#include "base/Text.h"
#include "end_to_end/Damage.h"
#include "end_to_end/Device.h"
#include "host/counters/CounterStore.h"
#include "host/files/FileLock.h"
#include "host/process/SystemClock.h"
#include "platform/testing/RecordingLog.h"

namespace end_to_end {
namespace {

// How far it is from one call that is tried to the next; 1 but where MORVEND_FAULT_STRIDE says.
std::size_t stride() {
  const char* given = std::getenv("MORVEND_FAULT_STRIDE");
  return given != nullptr ? std::strtoul(given, nullptr, 10) : 1;
}

constexpr char kFull[] = "full";  // a disk that stays so to the end of the run

std::string nameOf(const ::testing::TestParamInfo<const char*>& row) {
  std::string name = row.param;
  std::erase(name, '-');
  return name;
}

class FaultOf : public ::testing::TestWithParam<const char*> {};

TEST_P(FaultOf, CompletesTheDayAtAnyCallOfARun) {
  if (!faults::available()) GTEST_SKIP() << faults::kUnavailable;
  Device filled;
  filled.fill();
  Device device, clean;
  clean.become(filled);
  clean.run("morvend", {"-d"});
  const std::string name = GetParam();
  const bool kills = name.starts_with("kill"), stays = name == kFull;
  const std::string kind = stays ? "ENOSPC" : name;
  device.become(filled);
  const std::size_t calls = device.countCalls("morvend", {"-d"}, kind);
  ASSERT_GT(calls, 120u) << "is the shim not seeing those of the database library?";
  Figures figures(name);
  for (std::size_t at = 1; at <= calls; at += stride()) {
    device.become(filled);
    const auto faulty = device.run("morvend", {"-d"}, {.at = at, .kind = kind, .onward = stays});
    const std::string what = name + " at call " + std::to_string(at) + "\n" + faulty.standardError;
    // Events are written in one to three calls, so that the last ones may not come to it.
    EXPECT_TRUE(faulty.signal == (kills ? SIGKILL : 0) || at + 4 > calls) << what;
    EXPECT_TRUE(kills || ended(faulty)) << what;
    EXPECT_EQ(faulty.standardError.find("were not released"), std::string::npos) << what;
    // A single fault keeps nothing from being kept. Where a disk stays full, what can't be kept is
    // said last, and what couldn't leave any more waits for the next run.
    const bool late = device.dailyLogs().size() != 1;
    EXPECT_TRUE(!late || kills ||
                (stays && (device.record(kGateRecord) ||
                           lastLine(faulty).starts_with("<3>the day is not done: "))))
        << what;
    const auto next = device.run("morvend", {"-d"});
    EXPECT_EQ(next.status, 0) << what;
    figures.count(damageOf(filled, clean, device), late, what + "then\n" + next.standardError);
  }
}

INSTANTIATE_TEST_SUITE_P(Faults, FaultOf, ::testing::ValuesIn(faults::kKinds), nameOf);
INSTANTIATE_TEST_SUITE_P(Disk, FaultOf, ::testing::Values(kFull), nameOf);

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
  for (const char* kind : faults::kKinds) {
    device.become(waiting);
    const std::size_t calls = device.countCalls("pelloran", {"add", "k", "1000"}, kind);
    ASSERT_GT(calls, 10u);
    for (std::size_t at = 1; at <= calls; at += stride()) {
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

}  // namespace
}  // namespace end_to_end
