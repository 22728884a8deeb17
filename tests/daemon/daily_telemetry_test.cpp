// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "daemon/DailyTelemetry.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cerrno>

#include "NANDInfo/NANDInfo.h"
#include "daemon/EccEvents.h"
#include "platform/DeviceProperties.h"
#include "platform/ReportingChannels.h"
#include "support/ControllerBuffers.h"
#include "support/ControllerLists.h"
#include "support/TestPlatform.h"

namespace morvend {
namespace {

using platform::ChannelSample;
using platform::ReportChannel;
using plist::Dictionary;
using Lines = std::vector<std::string>;

constexpr char kNextEvent[] = "kern.next_ecc_event";

// An event of which every data entry is its index, plus one.
support::Bytes event(std::uint8_t id, std::uint8_t count) {
  support::Bytes bytes;
  support::put(bytes, id | std::uint32_t{count} << 8 | 0xFFFF0000U, 8);
  for (std::uint64_t i = 1; i <= 8; ++i) support::put(bytes, i, 8);
  return bytes;
}

struct DailyTelemetryTest : ::testing::Test {
  // What the telemetry records under the keys that begin so.
  Lines recorded(const std::string& beginning) {
    platform.counters.records.clear();
    CollectDailyTelemetry(platform.platform);
    Lines lines;
    for (const std::string& line : platform.counters.records) {
      if (line.starts_with("set " + beginning)) lines.push_back(line.substr(4 + beginning.size()));
    }
    return lines;
  }
  Lines structuredLogs() {
    platform.journal.clear();
    CollectEccEvents(platform.kernel, platform.housekeeping, platform.log);
    return platform.journal;
  }

  void addController() {
    platform.registry.add({.className = "NorbaEmbeddedNVMeController",
                           .properties = {{"Controller Characteristics", Dictionary()}}});
  }

  support::TestPlatform platform;
};

TEST_F(DailyTelemetryTest, DiskUsageIsInWholeMebibytesOrMinusOne) {
  using Usage = platform::DeviceProperties::DiskUsage;
  constexpr std::int64_t k64GiB = std::int64_t{64} << 30;
  const struct {
    std::optional<Usage> usage;
    const char *total, *free;
  } rows[] = {{{}, "-1", "-1"},
              {Usage{}, "-1", "-1"},
              {Usage{k64GiB, 0, 1}, "65536", "0"},
              {Usage{k64GiB - 1, {}, 1}, "65535", "-1"},
              {Usage{-1, -(1 << 20) - 1, {}}, "-1", "-2"},
              {Usage{INT64_MAX, {}, {}}, "8796093022207", "-1"}};
  for (const auto& row : rows) {
    platform.device.usage = row.usage;
    EXPECT_EQ(
        recorded("com.norba.tarvenn.DiskUsageUser"),
        (Lines{std::string("TotalBlocks ") + row.total, std::string("BlocksFree ") + row.free}));
  }
}

// What the library answers goes out as it is, or not at all.
TEST_F(DailyTelemetryTest, StorageHealthIsEveryNumberOfTheLibraryUnlessItReportsAnError) {
  constexpr char kFailure[] =
      "default: error reading nand info, error 1 with message Unable to parse buffer";
  platform.snapshots.snapshot = support::kernelSnapshot(5'000'000'000'000);
  constexpr std::size_t kDiskUsage = 2;  // recorded before
  EXPECT_EQ(recorded("").size(), kDiskUsage);
  EXPECT_EQ(platform.log.count(kFailure), 1);

  addController();
  for (const std::uint32_t method : {8U, 9U}) {
    platform.registry.alwaysTunnels(method, 13, 0, support::words({support::header(1, 1), 7}));
  }
  Dictionary info = *NANDInfo::CopyNANDInfo(platform.platform);
  EXPECT_GT(info.size(), 20u);
  info.set("TLM_VMFreezer_bytesWritten", 5'000'000'000'000);
  info.set("com.norba.NANDInfo.VMFreezer.NumPhysicalWrites", 5'000'000'000'000);
  Lines expected;
  for (const auto& [key, value] : info) expected.push_back(key + " " + description(value));
  Lines lines = recorded("");
  lines.erase(lines.begin(), lines.begin() + kDiskUsage);
  EXPECT_EQ(lines, expected);
  EXPECT_EQ(platform.log.count(kFailure), 1);
  EXPECT_EQ(platform.registry.problems(), Lines());
  // The day's dump of the lists sends no flag of its own beside the size query and the argument.
  Lines listCommands;
  for (const auto& input : platform.registry.inputs) {
    const auto word = [&input](std::size_t i) {
      return std::to_string(std::to_integer<int>(input[i]));
    };
    if (word(0) == "15" || word(0) == "17") listCommands.push_back(word(0) + "/" + word(4));
  }
  EXPECT_EQ(listCommands, (Lines{"17/1", "17/5", "17/9", "15/1"}));
}

// The beginnings of what each leaves, where lines of one follow each other only the first.
TEST_F(DailyTelemetryTest, RunsItsCollectorsInOrder) {
  addController();
  platform.registry.alwaysTunnels(9, 13, 0, support::words({support::header(1, 1), 7}));
  platform.registry.alwaysTunnels(9, 15, 0, support::defectsList(2, {{0, 0, 0, 0, 0, 0, 0, 0}}));
  platform.kernel.deliveries[kNextEvent] = {{0, event(1, 0)}};
  platform.networkUsage.records = {
      Dictionary{{"procName", "p"}, {"since", plist::Date{0}}, {"wifiInBytes", 4096}}};
  platform.reportingChannels.samples = {{{1, 1, "a"}, 5}};
  platform.counters.areInJournal = true;
  CollectDailyTelemetry(platform.platform);
  Lines beginnings;
  for (const std::string& line : platform.journal) beginnings.push_back(line.substr(0, 18));
  beginnings.erase(std::unique(beginnings.begin(), beginnings.end()), beginnings.end());
  EXPECT_EQ(beginnings, (Lines{"set com.norba.tarv", "structured 176 {\n ", "set com.norba.NAND",
                               "structured 172 {\n ", "add datausage.wifi", "set mobile/com.nor",
                               "synchronize com.no", "set com.norba.velq"}));
  EXPECT_EQ(platform.registry.calls.back(), "9 data 13/0") << "the statistics, after the lists";
}

TEST_F(DailyTelemetryTest, AnEccEventIsLoggedWithTheEntriesThatCount) {
  for (const int count : {0, 2, 8, 9, 255}) {
    Dictionary expected{{"id", 3}, {"count", count}};
    for (int i = 0; i < std::min(count, 8); ++i) expected.set("reg" + std::to_string(i), i + 1);
    const support::Bytes record = event(3, static_cast<std::uint8_t>(count));
    EXPECT_EQ(eccEventData(std::span(record).first<kEccEventRecordSize>()), expected);
  }
  support::Bytes record = event(255, 8);
  record.back() = std::byte{0x80};
  const Dictionary data = eccEventData(std::span(record).first<kEccEventRecordSize>());
  EXPECT_EQ(*data.find("reg7"), plist::Value(INT64_MIN + 8));
}

TEST_F(DailyTelemetryTest, AtMostTenEccEventsAreLoggedInARun) {
  auto& pending = platform.kernel.deliveries[kNextEvent];
  pending.resize(12, {0, event(1, 0)});
  EXPECT_EQ(structuredLogs().size(), 10u);
  EXPECT_EQ(pending.size(), 2u);
  EXPECT_EQ(structuredLogs().size(), 2u);
  EXPECT_TRUE(structuredLogs().empty());
  EXPECT_TRUE(platform.log.lines().empty());
}

// What a read doesn't fill is still that of the event before.
TEST_F(DailyTelemetryTest, AnEccReadHasTheLengthOfTheOneBefore) {
  support::Bytes shortened = event(2, 2);
  shortened.resize(16);
  shortened[8] = std::byte{9};
  platform.kernel.deliveries[kNextEvent] = {{0, event(1, 1)}, {0, shortened}, {0, event(3, 2)}};
  const auto structured = [](const Dictionary& data) {
    return "structured 172 " + description(plist::Value(data));
  };
  EXPECT_EQ(structuredLogs(),
            (Lines{structured({{"id", 1}, {"count", 1}, {"reg0", 1}}),
                   structured({{"id", 2}, {"count", 2}, {"reg0", 9}, {"reg1", 2}}),
                   structured({{"id", 3}, {"count", 2}, {"reg0", 1}, {"reg1", 2}})}));
  EXPECT_EQ(platform.kernel.rooms, (std::vector<std::size_t>{72, 72, 16}));
}

TEST_F(DailyTelemetryTest, OnlyAnUnexpectedErrorOfAnEccReadIsLogged) {
  for (const int error : {ENOENT, EBUSY, EIO, ENOMEM}) {
    platform.log.clear();
    platform.kernel.deliveries[kNextEvent] = {{0, event(1, 0)}, {error, {}}, {0, event(2, 0)}};
    EXPECT_EQ(structuredLogs().size(), 1u);
    const bool quiet = error == ENOENT || error == EBUSY;
    EXPECT_EQ(platform.log.lines(),
              quiet ? Lines{}
                    : Lines{"default: Unexpected errno (" + std::to_string(error) +
                            ") reading ECC events from kernel"});
  }
}

TEST_F(DailyTelemetryTest, OnlySimpleReportChannelsAreSubscribedToAndRecorded) {
  auto& channels = platform.reportingChannels;
  channels.samples = {
      {{1, 1, "a"}, 5}, {{2, 2, "histogram"}, 6}, {{3, 1, "b c"}, INT64_MIN}, {{4, 0, "none"}, 7}};
  constexpr char kPrefix[] = "com.norba.velquist.";
  EXPECT_EQ(recorded(kPrefix), (Lines{"a 5", "b c -9223372036854775808"}));
  EXPECT_EQ(channels.subscribed, (Lines{"a", "b c"}));
  channels.delivers = false;
  EXPECT_TRUE(recorded(kPrefix).empty());
  channels.subscribes = false;
  EXPECT_TRUE(recorded(kPrefix).empty());
  channels.subscribed.clear();
  channels.category = 0xFF;
  EXPECT_TRUE(recorded(kPrefix).empty());
  EXPECT_TRUE(channels.subscribed.empty());
}

}  // namespace
}  // namespace morvend
