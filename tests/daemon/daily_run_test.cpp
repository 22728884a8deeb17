// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "daemon/DailyRun.h"

#include <gtest/gtest.h>

#include <initializer_list>
#include <limits>
#include <optional>
#include <vector>

#include "daemon/Entry.h"
#include "platform/EventLoop.h"
#include "support/TestPlatform.h"

namespace morvend {
namespace {

using plist::Dictionary;
using plist::Value;
using Lines = std::vector<std::string>;

constexpr char kDomain[] = "com.norba.pellorand.morvend";
constexpr char kRecord[] = "LastCrashLogSerializationDateInDaysSince1970";

class DailyRunTest : public ::testing::Test {
 protected:
  DailyRunTest() {
    platform.counters.today = 20001;
    platform.device.versionText = "1";
    platform.whitelistScalars({"key"});
    for (std::int32_t day = 19990; day < 20010; ++day) platform.history.scalars[{day, "key"}] = day;
    platform.preferences.setMobile(kDomain, "LastOSVersion", "1");
  }

  void run(std::initializer_list<const char*> arguments) {
    DeviceContext context(platform.platform);
    const std::vector<const char*> vector(arguments);
    RunProcess(platform.platform, context, static_cast<int>(vector.size()), vector.data());
    EXPECT_EQ(platform.runLock.held, 0);
  }

  // The days whose values were reported.
  std::vector<std::int64_t> reportedDays() {
    std::vector<std::int64_t> days;
    for (const auto& log : platform.submission.logs) {
      const Dictionary contents = platform.parse(log.contents);
      days.push_back(contents.dictionary("PLScalars")->number("key")->int64Value());
      EXPECT_EQ(contents.find("PLActivatedAppInfo"), nullptr) << "none was delivered";
    }
    return days;
  }

  support::TestPlatform platform;
};

const std::string kDataUsage = "com.norba.quenset.morvend";
const Lines kSequence{"checkpoint",
                      "submit log-pellorand",
                      "set mobile/" + kDataUsage + "/netUsageBaseline = {\n}",
                      "synchronize " + kDataUsage,
                      "dump structured logs",
                      "roll servita logs"};
const std::string kWriteRecord = std::string("set mobile/") + kDomain + "/" + kRecord + " = 20000";
const std::string kSynchronize = std::string("synchronize ") + kDomain;

TEST_F(DailyRunTest, RunsTheSequenceInItsOrderThenWritesTheRecord) {
  run({"morvend", "-d", "-t"});
  Lines expected = kSequence;
  expected.insert(expected.end(), {kWriteRecord, kSynchronize});
  EXPECT_EQ(platform.journal, expected);
  EXPECT_EQ(platform.log.lines().front(), "default: morvend started");
  EXPECT_EQ(platform.log.lines().at(1), "default: daily tasks for day 20000");
  EXPECT_EQ(platform.log.lines().back(), "default: morvend ended");
  EXPECT_EQ(reportedDays(), std::vector<std::int64_t>{20000});
  const auto record = platform.preferences.mobile(kDomain, kRecord);
  EXPECT_EQ(record->as<plist::Number>()->type(), plist::Number::Type::int32);
  platform.submission.allowed = false;  // leaves the report out, and nothing else
  platform.journal.clear();
  run({"morvend", "-f"});
  Lines without = kSequence;
  without.erase(without.begin() + 1);
  EXPECT_EQ(platform.journal, without);
  EXPECT_EQ(platform.outbox.calls,
            (Lines{"settle 0", "hold 20000", "publish", "settle 20000", "hold", "publish"}));
}

TEST_F(DailyRunTest, OpensTheGateOnceADayWhateverTheClockDoes) {
  const struct {
    std::optional<Value> record;
    std::int32_t today;
    bool runs;
  } rows[] = {{{}, 20001, true},
              {Value(19999), 20001, true},
              {Value(20000), 20001, false},
              {Value(20001), 20001, false},
              {Value("text"), 20001, true},
              {Value(std::numeric_limits<std::int64_t>::min()), 20001, true},
              {Value(std::numeric_limits<std::int64_t>::max()), 20001, false},
              {Value(-5), -5, false},
              {Value(20000), std::numeric_limits<std::int32_t>::max(), true},
              {Value(20000), std::numeric_limits<std::int32_t>::min(), false},
              {{}, 1, false}};  // a missing record reads as 0
  for (const auto& row : rows) {
    support::TestPlatform device;
    device.counters.today = row.today;
    if (row.record) device.preferences.setMobile(kDomain, kRecord, *row.record);
    DeviceContext context(device.platform);
    RunDailyTasksIfDue(device.platform, context, nullptr);
    EXPECT_EQ(device.log.count("daily tasks for day"), row.runs ? 1 : 0) << row.today;
    EXPECT_EQ(device.log.count("default: Day unchanged since last run"), row.runs ? 0 : 1);
    if (!row.runs) {
      EXPECT_EQ(device.preferences.mobile(kDomain, kRecord), row.record);
      EXPECT_TRUE(device.journal.empty());
    }
    RunDailyTasksIfDue(device.platform, context, nullptr);
    EXPECT_EQ(device.log.count("daily tasks for day"), row.runs ? 1 : 0) << "second run";
    EXPECT_EQ(device.runLock.taken, 2);
  }
}

TEST_F(DailyRunTest, RunsNoDayWhileTheRecordCannotBeRead) {
  platform.preferences.readable = false;
  run({"morvend", "-d"});
  EXPECT_EQ(platform.journal, Lines{});
  EXPECT_EQ(platform.log.count("error: The record of the last day can't be read, so no day is run: "
                               "unreadable"),
            1);
}

TEST_F(DailyRunTest, SaysAndKeepsThatAReportIsLost) {
  const auto lost = [this] { return platform.preferences.mobile(kDomain, "LostReport"); };
  const auto expected = [](const char* why) {
    return Value(Dictionary{{"day", 20000}, {"why", why}});
  };
  platform.preferences.setMobile("com.norba.quenset", "DiagnosticLogSubmissionEnabled", false);
  platform.submission.allowed = false;
  run({"morvend", "-f"});
  EXPECT_EQ(lost(), std::nullopt) << "no consent, no loss";
  platform.preferences.readable = false;
  run({"morvend", "-f"});
  EXPECT_EQ(lost(), expected("the user's consent can't be read"));
  platform.preferences.readable = platform.submission.allowed = true;
  platform.submission.accepts = false;
  run({"morvend", "-d"});
  EXPECT_EQ(lost(), expected("its log couldn't be submitted"));
  EXPECT_EQ(platform.preferences.mobile(kDomain, kRecord), Value(20000));
  platform.submission.accepts = true;
  platform.history.scalars.clear();
  run({"morvend", "-f"});
  EXPECT_EQ(lost(), expected("its log couldn't be submitted")) << "no counters, no report to lose";
  platform.history.outcome = base::Error{"broken"};
  run({"morvend", "-f"});
  EXPECT_EQ(lost(), expected("broken"));
  EXPECT_EQ(platform.log.count("error: the report of day 20000 is lost: "), 3);
}

TEST_F(DailyRunTest, ActsOnItsFirstArgumentOnly) {
  platform.preferences.setMobile(kDomain, kRecord, 20000);
  const struct {
    std::initializer_list<const char*> arguments;
    Lines log;
    std::vector<std::int64_t> reported;
  } rows[] = {{{}, {}, {}},
              {{"morvend", "-d"}, {"default: Day unchanged since last run"}, {}},
              {{"morvend", "-f"}, {"default: daily tasks for day 20000"}, {20000}},
              {{"morvend", "-t", "-d"}, {"default: daily tasks for day 20001"}, {20001}},
              {{"morvend", "-D"}, {"default: Unknown arg: -D"}, {}},
              {{"morvend", "", "-f"}, {"default: Unknown arg: "}, {}},
              {{"morvend", "%s%n"}, {"default: Unknown arg: %s%n"}, {}}};
  for (const auto& row : rows) {
    platform.log.clear();
    platform.submission.logs.clear();
    run(row.arguments);
    Lines lines;
    for (const std::string& line : platform.log.lines()) {
      if (line.starts_with("default: ") && !support::isAboutStorage(line)) lines.push_back(line);
    }
    Lines expected{"default: morvend started"};
    expected.insert(expected.end(), row.log.begin(), row.log.end());
    expected.push_back("default: morvend ended");
    EXPECT_EQ(lines, expected);
    EXPECT_EQ(reportedDays(), row.reported);
  }
  EXPECT_EQ(platform.preferences.mobile(kDomain, kRecord), Value(20000));
}

TEST_F(DailyRunTest, ServesInSlicesUntilOneTimesOut) {
  using Result = platform::EventLoop::RunResult;
  for (const Result result : {Result::finished, Result::stopped, Result::handledSource}) {
    platform.service.script.push_back([result] { return result; });
  }
  run({"morvend"});
  Lines expected{"listen com.norba.pellorand.morvend"};
  expected.insert(expected.end(), 4, "run loop 10 1");
  EXPECT_EQ(platform.journal, expected);
  platform.journal.clear();
  platform.service.registers = false;
  run({"morvend"});
  EXPECT_EQ(platform.journal, (Lines{"listen com.norba.pellorand.morvend", "run loop 10 1"}));
  EXPECT_EQ(platform.log.lines(), (Lines{"default: morvend started", "default: morvend ended",
                                         "default: morvend started", "default: morvend ended"}));
}

}  // namespace
}  // namespace morvend
