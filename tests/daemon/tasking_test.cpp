// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "daemon/Tasking.h"

#include <optional>
#include <vector>

#include <gtest/gtest.h>

#include "support/TestPlatform.h"

namespace morvend {
namespace {

using plist::Array;
using plist::Dictionary;
using plist::Value;
using Lines = std::vector<std::string>;

constexpr char kDomain[] = "com.norba.pellorand.morvend";

Dictionary item(const char* user, const char* key, Value value) {
  return {{"Domain", "com.example"}, {"User", user}, {"Key", key}, {"Value", std::move(value)}};
}

class TaskingTest : public ::testing::Test {
 protected:
  TaskingTest() {
    platform.counters.today = 20001;
    setBuild("A1");
  }

  void setBuild(const char* build) {
    platform.device.version = Dictionary{{"ProductBuildVersion", build}};
  }

  void schedule(Dictionary tasking) {
    platform.preferences.values.insert_or_assign(
        {"__quenset__", "com.norba.Varnhollow", "ScheduledTasking"}, Value(std::move(tasking)));
  }

  // What one run did: its lines in the log, then the journal without the daemon's own records.
  Lines run() {
    platform.log.clear();
    platform.journal.clear();
    UpdateTaskingState(platform.platform);
    Lines done = platform.log.lines();
    for (const std::string& line : platform.journal) {
      if (line.find(std::string("mobile/") + kDomain) == std::string::npos) done.push_back(line);
    }
    return done;
  }

  std::optional<Value> stored(const char* key) { return platform.preferences.mobile(kDomain, key); }

  support::TestPlatform platform;
};

const std::string kPosted = "post com.norba.da.tasking_changed";
const std::string kSynchronized = std::string("synchronize ") + kDomain;

TEST_F(TaskingTest, RecordsChangesOfTheBuild) {
  EXPECT_EQ(run(), Lines{"default: OS change since last run ((null) -> A1)"});
  EXPECT_EQ(stored("LastOSUpdate"), Value(Dictionary{{"version", "A1"}, {"day", 20001}}));
  EXPECT_EQ(run(), Lines{});
  setBuild("A2");
  EXPECT_EQ(run(), Lines{"default: OS change since last run (A1 -> A2)"});
  platform.device.version.reset();
  EXPECT_EQ(run(), Lines{});
  platform.preferences.setMobile(kDomain, "LastOSUpdate", "not a dictionary");
  setBuild("A2");
  EXPECT_EQ(run(), Lines{"default: OS change since last run ((null) -> A2)"});
}

TEST_F(TaskingTest, AppliesKeepsReplacesAndReappliesATasking) {
  run();
  schedule({{"TaskingID", "T1"},
            {"TaskingDigest", "D1"},
            {"TaskingPayload", Array{item("mobile", "a", 1), item("__quenset__", "b", 2),
                                     item("mobile", "c", "x"), item("guest", "d", 3)}}});
  const Lines applied{"set mobile/com.example/a = 1",
                      "set __quenset__/com.example/b = 2",
                      "synchronize configuration com.example",
                      "set mobile/com.example/c = x",
                      "privileged set",
                      "set guest/com.example/d = 3",
                      "synchronize com.example",
                      kSynchronized,
                      kPosted};
  EXPECT_EQ(run(), applied);
  EXPECT_EQ(stored("TaskingID"), Value("T1"));
  EXPECT_EQ(stored("TaskingOS"), Value("A1"));
  EXPECT_EQ(stored("TaskingDigest"), Value("D1"));
  EXPECT_EQ(stored("TaskingPayload")->as<Array>()->size(), 4u);
  EXPECT_EQ(run(), Lines{}) << "the same tasking under the same build";

  const Lines undone{"remove mobile/com.example/a", "remove __quenset__/com.example/b",
                     "remove mobile/com.example/c", "privileged delete",
                     "remove guest/com.example/d"};
  setBuild("A2");
  Lines again{"default: OS change since last run (A1 -> A2)",
              "default: Tasking update (T1 -> T1, A1 -> A2)"};
  again.insert(again.end(), undone.begin(), undone.end());
  again.insert(again.end(), applied.begin(), applied.end());
  // Domains are synchronised once, in the order in which they were first touched.
  std::erase(again, "synchronize com.example");
  again.insert(again.end() - 2, "synchronize com.example");
  EXPECT_EQ(run(), again);

  schedule({{"TaskingID", "T2"}});
  Lines replaced{"default: Tasking update (T1 -> T2, A2 -> A2)"};
  replaced.insert(replaced.end(), undone.begin(), undone.end());
  replaced.insert(replaced.end(), {"synchronize com.example", kSynchronized, kPosted});
  EXPECT_EQ(run(), replaced);
  for (const char* key : {"TaskingID", "TaskingDigest", "TaskingPayload"}) {
    EXPECT_EQ(stored(key), std::nullopt) << key;
  }
  EXPECT_EQ(stored("TaskingOS"), Value("A2"));
  // Nothing stored and no payload: the notification is posted every day.
  EXPECT_EQ(run(), Lines{kPosted});
  EXPECT_EQ(run(), Lines{kPosted});
}

TEST_F(TaskingTest, SaysWhenItChangesTheConsent) {
  run();
  const std::string said = "Tasking T1 changed the user's consent to logs: ";
  for (const bool after : {false, true, true}) {
    schedule({{"TaskingID", "T1"}, {"TaskingPayload", Array{item("mobile", "a", after)}}});
    platform.preferences.setMobile(kDomain, "TaskingOS", "other");
    // What the item means to the service whose consent it is.
    platform.submission.asked = [this] {
      const auto consent = platform.preferences.mobile("com.example", "a");
      platform.submission.allowed = !consent || *consent == Value(true);
    };
    const bool before = platform.submission.DiagnosticLogSubmissionEnabled();
    run();
    EXPECT_EQ(platform.log.count("default: " + said + "they are submitted from now on"),
              after && !before);
    EXPECT_EQ(platform.log.count("default: " + said + "none is submitted any more"),
              !after && before);
  }
}

TEST_F(TaskingTest, NeverTakesAnUnknownBuildForTheSame) {
  platform.device.version.reset();
  schedule({{"TaskingID", "T1"}, {"TaskingPayload", Array{}}});
  EXPECT_EQ(run(), (Lines{kSynchronized, kPosted}));
  EXPECT_EQ(stored("TaskingOS"), std::nullopt);
  EXPECT_EQ(run(), (Lines{"default: Tasking update (T1 -> T1, (null) -> (null))", kSynchronized,
                          kPosted}));
}

TEST_F(TaskingTest, LeavesStoredKeysWhenNoPayloadIsStored) {
  run();
  platform.preferences.setMobile(kDomain, "TaskingID", "T0");
  platform.preferences.setMobile(kDomain, "TaskingDigest", "D0");
  schedule({{"TaskingID", "T1"}});
  EXPECT_EQ(run(), (Lines{"default: Tasking update (T0 -> T1, (null) -> A1)", kPosted}));
  EXPECT_EQ(stored("TaskingID"), Value("T0"));
  EXPECT_EQ(stored("TaskingDigest"), Value("D0"));
}

TEST_F(TaskingTest, SkipsWhatIsNoTaskingAndWhatIsNoSetting) {
  run();
  schedule({{"TaskingPayload", Array{item("mobile", "a", 1)}}});
  EXPECT_EQ(run(), Lines{}) << "without an ID";
  schedule({{"TaskingID", 5},
            {"TaskingPayload", Array{Value("text"), Dictionary{{"User", "mobile"}, {"Key", "k"}},
                                     item("mobile", "a", 1)}}});
  EXPECT_EQ(run(), (Lines{"error: Tasking: skipping an item without a text as Domain, User or Key",
                          "error: Tasking: skipping an item without a text as Domain, User or Key",
                          "set mobile/com.example/a = 1", "synchronize com.example", kSynchronized,
                          kPosted}));
  EXPECT_EQ(run(), Lines{});
}

TEST_F(TaskingTest, ReportsEachDisabledLogOnce) {
  auto reported = [&] {
    platform.eventra.events.clear();
    run();
    Lines types;
    for (const auto& [event, payload] : platform.eventra.events) {
      EXPECT_EQ(event, "com.norba.quenset.disabledLogs");
      EXPECT_EQ(payload.size(), 1u);
      types.push_back(*payload.text("bugType"));
    }
    return types;
  };
  platform.preferences.blocklist = {"193", "110"};
  EXPECT_EQ(reported(), (Lines{"110", "193"}));
  platform.preferences.setMobile("com.norba.da", "disabledLogs", "193");
  EXPECT_EQ(reported(), (Lines{"110", "193"})) << "not an array: the blocklist stands";
  platform.preferences.setMobile("com.norba.da", "disabledLogs", Array{"7", "7", 8, "9"});
  EXPECT_EQ(reported(), (Lines{"7", "9"}));
  platform.preferences.setMobile("com.norba.da", "disabledLogs", Array{});
  EXPECT_EQ(reported(), Lines{});
}

}  // namespace
}  // namespace morvend
