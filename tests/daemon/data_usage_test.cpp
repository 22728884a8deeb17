// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "daemon/DataUsage.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>

#include "daemon/DataUsageChanges.h"
#include "host/Host.h"
#include "platform/AllServices.h"
#include "platform/PLHistory.h"
#include "plist/PropertyList.h"
#include "support/TemporaryFolder.h"
#include "support/TestPlatform.h"

namespace morvend {
namespace {

void collect(const platform::AllServices& all,
             std::chrono::nanoseconds patience = kUsageServicePatience) {
  CollectDataUsage(all.networkUsage, all.counters, all.preferences, all.log, patience);
}

using plist::Array;
using plist::Date;
using plist::Dictionary;
using plist::Value;
using Lines = std::vector<std::string>;

constexpr char kDomain[] = "com.norba.quenset.morvend";
constexpr char kBaseline[] = "netUsageBaseline";

constexpr double kDay = 86400, kToday = 20000 * kDay, kYesterday = kToday - kDay;

Dictionary usage(Dictionary named, double since, const std::vector<Value>& counts) {
  const char* const names[] = {"wifiInBytes", "wifiOutBytes", "wwanInBytes", "wwanOutBytes"};
  named.set("since", Date{since});
  for (std::size_t i = 0; i < counts.size(); ++i) named.set(names[i], counts[i]);
  return named;
}
Dictionary bundle(double since, const std::vector<Value>& counts) {
  return usage({{"bundleName", "b"}, {"procName", "p"}}, since, counts);
}

// The additions without the family that every key begins with.
Lines texts(const std::vector<CounterAddition>& additions) {
  const std::string family = "datausage.";
  Lines lines;
  for (const auto& [key, value] : additions) {
    EXPECT_TRUE(key.starts_with(family)) << key;
    lines.push_back(key.substr(family.size()) + " " + std::to_string(value));
  }
  return lines;
}

TEST(DataUsageChanges, AreTheDifferencesToTheDayBefore) {
  const Date long_ago{kToday - 30 * kDay};
  const double since = long_ago.secondsSince1970;
  const Array base{long_ago, 5000, 5000, 5000, 5000};
  const Value kNone("no array"), old(1024), big(std::int64_t{1} << 40),
      huge(std::uint64_t{1} << 63);
  const struct {
    const char* what;
    Value baseline;  // of "b"
    double since;
    std::vector<Value> counts;
    Lines additions;
  } rows[] = {
      {"new today", kNone, kToday, {5000, 0, 1023, 1024}, {"wifiInKB.b 4", "wwanOutKB.b 1"}},
      {"yesterday's first instant", kNone, kYesterday, {2048}, {"wifiInKB.b 2"}},
      {"the last one before it", kNone, kYesterday - 0.5, {9999, 9999}, {"olddata.b 1"}},
      {"the future", kNone, 1e300, {2048}, {"wifiInKB.b 2"}},
      {"no time at all", kNone, std::nan(""), {2048}, {"olddata.b 1"}},
      {"grown", base, since, {7048, 6023, 6024, 5000}, {"wifiInKB.b 2", "wwanInKB.b 1"}},
      {"down", base, since, {4999, 5000, "text"}, Lines(3, "baddata.b 1")},
      {"a fraction more", base, since + 0.75, {7048, 5000, 5000, 5000}, {"wifiInKB.b 2"}},
      {"another period, old", base, since + 1, {9999}, {"olddata.b 1"}},
      {"another period, of yesterday", base, kYesterday + 5, {9216, 1023.9}, {"wifiInKB.b 9"}},
      {"a short entry", Array{long_ago, "text"}, since, {0, old}, {"wifiOutKB.b 1"}},
      {"an entry without a date", Array{1, 2}, kToday, {old}, {"wifiInKB.b 1"}},
      {"an empty entry", Array{}, kToday, {old}, {"wifiInKB.b 1"}},
      {"no entry", "text", since, {old}, {"olddata.b 1"}},
      {"large",
       Array{long_ago, 0, INT64_MIN, 1, -1},
       since,
       {big, INT64_MAX, INT64_MIN, INT64_MAX},
       {"wifiInKB.b 1073741824", "baddata.b 1", "wwanInKB.b 9007199254740991", "baddata.b 1"}},
      {"beyond 63 bits",
       kNone,
       kToday,
       {huge, 1e300},
       {"wifiInKB.b -9007199254740992", "wifiOutKB.b 9007199254740991"}},
  };
  for (const auto& row : rows) {
    const Array records{bundle(row.since, row.counts)};
    const auto changes = dataUsageChanges({{"b", row.baseline}}, records, Date{kYesterday});
    EXPECT_EQ(texts(changes.additions), row.additions) << row.what;
    ASSERT_EQ(changes.baseline.size(), 1u) << row.what;
    const Array& entry = *changes.baseline.begin()->value.as<Array>();
    ASSERT_EQ(entry.size(), 5u) << row.what;
    const double stored = entry[0].as<Date>()->secondsSince1970;
    EXPECT_TRUE(stored == row.since || std::isnan(stored)) << row.what;
    // Kept as they came, so that the same records the next day add nothing but old data.
    const auto next = dataUsageChanges(changes.baseline, records, Date{kToday});
    EXPECT_LE(next.additions.size(), std::isnan(stored) ? 1u : 0u) << row.what;
  }
}

TEST(DataUsageChanges, SkipWhatIsNoRecordAndKeepTheLatestOfAName) {
  Dictionary undated = bundle(kToday, {4096});
  undated.set("since", "2026-11-22");
  const Array records{"text",
                      usage({}, kToday, {4096}),
                      undated,
                      usage({{"bundleName", ""}}, 0, {}),
                      bundle(kToday, {4096}),
                      usage({{"bundleName", 7}, {"procName", "b"}}, kToday, {8192, 1, 2, 3})};
  const auto changes = dataUsageChanges({{"gone", Array{Date{kToday}}}}, records, Date{kYesterday});
  EXPECT_EQ(texts(changes.additions),
            (Lines{"olddata. 1", "wifiInKB.b 4", "wifiInKB.com.norba.b 8"}));
  EXPECT_EQ(changes.baseline, (Dictionary{{"", Array{Date{0}, 0, 0, 0, 0}},
                                          {"b", Array{Date{kToday}, 8192, 1, 2, 3}}}));
}

TEST(DataUsageStep, ReplacesTheBaselineWhateverTheReply) {
  const Dictionary baseline{{"b", Array{Date{kToday}, 1024}}};
  const struct {
    Value stored;
    std::optional<Array> reply;
    Lines records;
    Dictionary baseline;
  } rows[] = {
      {baseline,
       Array{bundle(kToday, {4096})},
       {"add datausage.wifiInKB.b 3"},
       {{"b", Array{Date{kToday}, 4096, 0, 0, 0}}}},
      {"no dictionary",
       Array{bundle(kYesterday, {4096})},
       {"add datausage.wifiInKB.b 4"},
       {{"b", Array{Date{kYesterday}, 4096, 0, 0, 0}}}},
      {baseline, Array(), {}, {}},
      {baseline, {}, {}, {}},
  };
  for (const auto& row : rows) {
    support::TestPlatform device;
    device.counters.today = 20000;
    device.preferences.setMobile(kDomain, kBaseline, row.stored);
    device.networkUsage.records = row.reply;
    collect(device.platform);
    EXPECT_EQ(device.counters.records, row.records);
    EXPECT_EQ(device.preferences.mobile(kDomain, kBaseline), Value(row.baseline));
    ASSERT_EQ(device.journal.size(), 2u);
    EXPECT_EQ(device.journal[1], std::string("synchronize ") + kDomain);
    EXPECT_TRUE(device.log.lines().empty());
  }
}

TEST(DataUsageStep, GoesOnWithoutAReplyAndDealsWithALateOne) {
  support::TestPlatform device;
  device.counters.today = 20000;
  device.networkUsage.repliesAtOnce = false;
  collect(device.platform, std::chrono::nanoseconds(1));
  EXPECT_EQ(device.log.lines(), Lines{"default: Vexmor timed out, no datausage available"});
  EXPECT_TRUE(device.journal.empty());
  const Array records{bundle(kToday, {4096})};
  device.networkUsage.pending.at(0)(&records);
  EXPECT_EQ(device.counters.records, Lines{"add datausage.wifiInKB.b 4"});
  EXPECT_EQ(device.journal.size(), 2u);
}

// A run that was ended between the counters and the baseline has counted already: the next one goes
// on from there. Where the counters refuse, both stay.
TEST(DataUsageStep, CountsOnceWhereverARunEnds) {
  support::TestPlatform device;
  device.counters.today = 20000;
  const auto run = [&device](std::vector<Value> counts) {
    device.counters.records.clear();
    device.networkUsage.records = Array{bundle(kToday, counts)};
    collect(device.platform);
    return device.counters.records;
  };
  const auto baseline = [&device] { return device.preferences.mobile(kDomain, kBaseline); };
  const auto lose = [&device](const std::optional<Value>& before) {
    device.preferences.values.clear();
    if (before) device.preferences.setMobile(kDomain, kBaseline, *before);
  };
  for (const bool first : {true, false}) {  // without a baseline, and with one
    const auto before = baseline();
    const int at = first ? 0 : 10 << 10;
    EXPECT_EQ(run({at + 2048}), Lines{"add datausage.wifiInKB.b 2"});
    lose(before);
    EXPECT_EQ(run({at + 2048}), Lines{});
    lose(before);
    EXPECT_EQ(run({at + 5120}), Lines{"add datausage.wifiInKB.b 3"});
    const auto after = baseline();
    device.counters.refuses = true;
    EXPECT_EQ(run({at + 10240}), Lines{});
    EXPECT_EQ(baseline(), after);
    device.counters.refuses = false;
    EXPECT_EQ(run({at + 10240}), Lines{"add datausage.wifiInKB.b 5"});
  }
  // An empty reply leads back to the first baseline, from which nothing is counted any more.
  device.networkUsage.records = Array();
  collect(device.platform);
  EXPECT_EQ(run({4096}), Lines{"add datausage.wifiInKB.b 4"});
  lose(Value(Dictionary()));
  device.preferences.readable = false;
  EXPECT_EQ(run({8192}), Lines{}) << "a baseline that can't be read is not none";
}

// On the host, where the reply is another thread's.
class DataUsageThreads : public ::testing::Test {
 protected:
  // This many processes, each with four KiB.
  static Array processes(int count) {
    Array records;
    for (int i = 0; i < count; ++i) {
      records.push_back(usage({{"procName", std::to_string(i)}}, 1e11, {4096}));
    }
    return records;
  }

  void answer(const Array& records, double delay) {
    folder.write("device/network-usage.plist",
                 *plist::writeXML(Dictionary{{"Records", records}, {"ReplyDelay", delay}}));
  }

  // The sum of the day's scalars.
  std::int64_t recorded() {
    host::Host host({.root = folder.path()});
    std::int64_t sum = 0;
    EXPECT_TRUE(host.services().history.initWithDefaultPath()->scalarsForKeyPrefix(
        "", INT32_MIN, INT32_MAX,
        [&](std::string_view, std::int32_t, std::int64_t value, bool&) { sum += value; }));
    return sum;
  }

  support::TemporaryFolder folder;
};

TEST_F(DataUsageThreads, AReplyRunsBesideTheRestOfTheDay) {
  constexpr int kProcesses = 100, kOthers = 100;
  answer(processes(kProcesses), 0);
  {
    host::Host host({.root = folder.path()});
    const platform::AllServices& platform = host.services();
    collect(platform, std::chrono::nanoseconds(0));
    for (int i = 0; i < kOthers; ++i) {
      platform.counters.PLClientAddValueForScalarKey("other", 1);
      const Value value(i);
      platform.preferences.QNSPreferencesSetValue("other", &value, kDomain);
      platform.preferences.QNSPreferencesSynchronize(kDomain);
      if (i % 20 == 0) platform.counters.PLClientCheckpoint();
    }
    // Replies come in the order of the queries, so that this one's end is the end of both.
    collect(platform);
    const auto baseline = platform.preferences.QNSPreferencesGetValue(kBaseline, kDomain);
    EXPECT_EQ(baseline->as<Dictionary>()->size(), static_cast<std::size_t>(kProcesses));
  }
  EXPECT_EQ(recorded(), 4 * kProcesses + kOthers);
}

// The reply is written by the time that the step returns, which is the last thing that it brings
// about.
TEST_F(DataUsageThreads, TheStepWaitsForAllThatAReplyDoes) {
  EXPECT_EQ(kUsageServicePatience, std::chrono::seconds(10));
  answer(processes(2000), 0);
  host::Host host({.root = folder.path()});
  collect(host.services());
  const std::string file = folder.read("var/preferences/mobile/" + std::string(kDomain) + ".plist");
  EXPECT_NE(file.find("<key>1999</key>"), file.npos);
}

// The end of the process may meet the reply at any moment, or the reply never come.
TEST_F(DataUsageThreads, AReplyIsWholeOrNotAtAll) {
  for (const bool comes : {false, true}) {
    answer(processes(2), comes ? 0 : std::numeric_limits<double>::infinity());
    for (int i = 0; i < 20; ++i) {
      host::Host host({.root = folder.path()});
      collect(host.services(),
              comes && i == 19 ? kUsageServicePatience : std::chrono::microseconds(20 * i));
    }
    EXPECT_EQ(recorded(), comes ? 8 : 0);
  }
}

}  // namespace
}  // namespace morvend
