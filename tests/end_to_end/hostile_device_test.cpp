// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Whatever the device's services answer, the day ends with its record written, and nothing is left
// of it in the process.

#include <gtest/gtest.h>

#include <unistd.h>
#include <algorithm>
#include <filesystem>
#include <functional>
#include <iterator>
#include <random>
#include <thread>
#include <utility>

#include "NANDInfo/APIErrorMessage.h"
#include "NANDInfo/Controller.h"
#include "NANDInfo/StructuredLogs.h"
#include "NANDInfo/interface/Exporters.h"
#include "daemon/Entry.h"
#include "end_to_end/Device.h"
#include "host/Host.h"
#include "platform/testing/FaultInjector.h"
#include "plist/PropertyList.h"
#include "support/ControllerLists.h"
#include "support/ControllerRoot.h"
#include "support/FreshErrors.h"

namespace end_to_end {
namespace {

using platform::AllServices;
using plist::Data;

std::ptrdiff_t entriesOf(const char* folder) {
  return std::distance(std::filesystem::directory_iterator(folder), {});
}

constexpr char kThreads[] = "/proc/self/task";

// Those that stay: the test's own, and the thread sanitizer's, which begins with the first other
// one. The kernel shows a thread a moment longer than its join takes.
std::ptrdiff_t threadsOfTheTest() {
  pid_t other = 0;
  std::thread([&] { other = ::gettid(); }).join();
  while (std::filesystem::exists(kThreads + ("/" + std::to_string(other)))) ::usleep(100);
  return entriesOf(kThreads);
}

// Runs the daily sequence in this process, as `main` does; what was written to standard error. The
// platform may be wrapped.
std::string runDay(
    const Device& device,
    const std::function<void(const AllServices&, const std::function<void(const AllServices&)>&)>&
        wrap = [](const AllServices& platform, const auto& run) { run(platform); }) {
  ::setenv("DBUS_SYSTEM_BUS_ADDRESS", "unix:path=/nonexistent", 1);
  NANDInfo::ResetExporters();
  support::freshErrors();
  NANDInfo::gForceCollectionSet = false;
  static const std::ptrdiff_t threads = threadsOfTheTest();
  const auto files = entriesOf("/proc/self/fd");
  ::testing::internal::CaptureStderr();
  {
    host::Host host({.root = device.root().path()});
    wrap(host.services(), [](const AllServices& platform) {
      morvend::DeviceContext context(platform);
      const char* const arguments[] = {"morvend", "-d"};
      morvend::RunProcess(platform, context, 2, arguments);
    });
  }
  const std::string said = ::testing::internal::GetCapturedStderr();
  EXPECT_EQ(entriesOf("/proc/self/fd"), files) << said;
  for (int i = 0; i < 1000 && entriesOf(kThreads) > threads; ++i) ::usleep(1000);
  EXPECT_EQ(entriesOf(kThreads), threads) << said;
  EXPECT_EQ(said.find("were not released"), std::string::npos) << said;
  EXPECT_EQ(linesOf(said).back(), "morvend ended");
  EXPECT_EQ(device.record("LastCrashLogSerializationDateInDaysSince1970"),
            Value(device.today() - 1))
      << said;
  return said;
}

// Every value of a property list but the outermost.
void collectValues(Value& value, std::vector<Value*>& all) {
  const auto add = [&all](Value& inner) {
    all.push_back(&inner);
    collectValues(inner, all);
  };
  if (auto* array = value.as<Array>()) {
    for (Value& element : *array) add(element);
  } else if (auto* dictionary = value.as<Dictionary>()) {
    for (const auto& entry : *dictionary) add(*dictionary->find(entry.key));
  }
}

class HostileDevice : public ::testing::Test {
 protected:
  HostileDevice() { filled.fill(); }

  Data randomData(std::size_t size) {
    Data bytes(size);
    for (auto& byte : bytes) byte = static_cast<std::uint8_t>(random());
    return bytes;
  }

  // A day on the filled device with one file replaced.
  void runWith(const std::string& path, const std::string& bytes, const std::string& what) {
    SCOPED_TRACE(path + ": " + what);
    Device device;
    device.become(filled);
    device.root().write(path, bytes);
    runDay(device);
  }

  Device filled;
  std::mt19937 random{1};
};

// Each value of each file, one after the other, becomes something else: names that nobody knows,
// buffers that lie, counts that can't be.
TEST_F(HostileDevice, EndsTheDayWhateverAValueIsReplacedBy) {
  constexpr std::size_t kTurns = 8;  // of the replacements, for each value
  Data lyingCount(24, 0xFF);
  lyingCount[0] = 4;
  const Dictionary announced{{"Data", lyingCount}, {"Announce", std::int64_t{1} << 32}};
  const Dictionary failing{{"Data", lyingCount}, {"FailData", 5}};
  const Value others[] = {Array(),           Dictionary(),   "",        announced,
                          randomData(20000), failing,        "x",       -1,
                          lyingCount,        randomData(1),  INT64_MAX, 1e300,
                          Array{"x"},        randomData(40), true,      Dictionary{{"", -1}}};
  std::size_t next = 0;
  for (const std::string& name : filled.names("device")) {
    if (!name.ends_with(".plist")) continue;
    Value list = *filled.readPropertyList("device/" + name);
    std::vector<Value*> values;
    collectValues(list, values);
    for (std::size_t i = 0; i < values.size(); ++i) {
      for (std::size_t turn = 0; turn < kTurns; ++turn) {
        // Moved, so that the values within stay where they are.
        Value whole = std::exchange(*values[i], others[next++ % std::size(others)]);
        runWith("device/" + name, *plist::writeXML(list), std::to_string(i));
        *values[i] = std::move(whole);
      }
    }
  }
}

TEST_F(HostileDevice, EndsTheDayWhateverAFileHolds) {
  Array channels;
  for (int i = 0; i < 3000; ++i) {
    channels.push_back(Dictionary{{"Name", std::string(300, 'c') + std::to_string(i)},
                                  {"Category", 0x100},
                                  {"Format", 1},
                                  {"Value", INT64_MIN}});
  }
  for (const char* path :
       {"device/registry.plist", "device/kernel-snapshot.bin", "device/ecc-events/1",
        "device/report-channels.plist", "device/network-usage.plist", "device/kernel.plist",
        kModule, kWhitelist, "var/preferences/__quenset__/com.norba.Varnhollow.plist"}) {
    const std::string whole = filled.root().read(path);
    runWith(path, "", "empty");
    runWith(path, whole.substr(0, whole.size() / 2), "cut");
    runWith(path, *plist::writeXML(channels), "an array");
    for (const std::size_t size : {1u, 71u, 73u, 5000u}) {
      const Data bytes = randomData(size);
      runWith(path, std::string(bytes.begin(), bytes.end()), "random");
    }
  }
}

// A list of defects of a kind that nobody knows.
TEST_F(HostileDevice, SaysLittleOfALongList) {
  const auto defects = [](std::size_t count, std::uint32_t mode) {
    return Value(support::data(support::defectsList(
        2, std::vector<std::vector<std::uint32_t>>(count, {1, 0, 3, 4, 5, 6, 7, mode}))));
  };
  Value list = *filled.readPropertyList("device/registry.plist");
  std::vector<Value*> values;
  collectValues(list, values);
  const auto known =
      std::ranges::find_if(values, [&](const Value* value) { return *value == defects(1, 0); });
  ASSERT_NE(known, values.end());
  **known = defects(3000, 0xBAD);
  filled.writePropertyList("device/registry.plist", list);
  const std::string said = runDay(filled);
  EXPECT_LT(said.size(), 64u << 10);
  EXPECT_NE(said.find("\n2997 more messages like \"Encountered unexpected defectMode: 0xbad\"\n"),
            said.npos);
}

// A service that fails once, at any call. A day whose record can't be read is the next run's.
TEST_F(HostileDevice, EndsTheDayWhicheverCallFails) {
  int calls = 1;
  for (int failing = 0; failing <= calls; ++failing) {
    Device device;
    device.become(filled);
    const std::string said = runDay(device, [&](const AllServices& platform, const auto& run) {
      platform::fakes::FaultInjector faults(platform);
      faults.failAt(failing);
      run(faults.platform());
      if (failing == 0) calls = faults.calls();
      run(platform);
    });
    // The rest of the sequence has run too.
    EXPECT_TRUE(device.readPropertyList("var/preferences/mobile/com.norba.quenset.morvend.plist") ||
                said.find("Data usage is left for the next run") != said.npos);
    EXPECT_EQ(device.names(kSubmitted).back(), "structured-2020-01-01.jsonl");
    EXPECT_EQ(device.names("var/log/servita"), (Lines{"a.log.1", "a.log.2"}));
    if (HasFailure()) FAIL() << "call " << failing << " of " << calls;
  }
  EXPECT_GT(calls, 70);
}

}  // namespace
}  // namespace end_to_end
