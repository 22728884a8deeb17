// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include <gtest/gtest.h>

#include <algorithm>
#include <map>

#include "NANDInfo/APIErrorMessage.h"
#include "NANDInfo/KeyTables.h"
#include "NANDInfo/Parsers.h"
#include "NANDInfo/StructuredLogs.h"
#include "NANDInfo/TelemetryList.h"
#include "base/Text.h"
#include "host/Host.h"
#include "platform/PreferenceStore.h"
#include "plist/JSON.h"
#include "support/ControllerBuffers.h"
#include "support/FreshErrors.h"
#include "support/TemporaryFolder.h"
#include "tools/demo/Device.h"
#include "tools/mkdevice/ControllerBuffers.h"
#include "tools/mkdevice/DeviceMaker.h"
#include "tools/mkdevice/Sample.h"
#include "tools/mkdevice/SampleController.h"
#include "tools/mkdevice/SampleCounters.h"
#include "tools/mkdevice/SampleDay.h"
#include "tools/mkdevice/SampleFiles.h"
#include "tools/mkdevice/SampleUsage.h"
#include "tools/mkdevice/Vocabulary.h"

namespace {

namespace fs = std::filesystem;
using namespace mkdevice;

constexpr std::int32_t kToday = 20779;

struct Maker {
  std::string make(const fs::path& folder, const Sample& sample, int days = 0) {
    warnings = 0;
    const MakingOptions options{folder.string(), sample, days, "/nowhere/module.so"};
    const auto made = makeDevice(options, {.progress = [](const std::string&) {},
                                           .warning = [this](const std::string&) { ++warnings; }});
    return made ? "" : made.error().text;
  }
  int warnings = 0;
};

// Path below the folder to bytes, of every file.
std::map<std::string, std::string> filesOf(const fs::path& folder) {
  std::map<std::string, std::string> files;
  for (const auto& entry : fs::recursive_directory_iterator(folder)) {
    const std::string path = entry.path().lexically_relative(folder).string();
    if (!entry.is_regular_file()) continue;
    std::ifstream file(entry.path(), std::ios::binary);
    files[path] = {std::istreambuf_iterator<char>(file), {}};
    EXPECT_EQ(entry.status().permissions(), fs::perms::owner_read | fs::perms::owner_write) << path;
  }
  return files;
}

TEST(Mkdevice, TheSameSeedOnTheSameDayMakesTheSameDevice) {
  Maker maker;
  for (const auto& [scale, days] : {std::pair{1, 0}, {2, 0}, {1, 3}}) {
    support::TemporaryFolder folder;
    for (const char* name : {"a", "b", "deep/below/c"}) {
      const std::uint64_t seed = name[0] == 'd' ? 2 : 1;
      ASSERT_EQ(maker.make(folder / name, {.seed = seed, .scale = scale, .today = kToday}, days),
                "");
      EXPECT_EQ(maker.warnings, 1) << "the missing module";
    }
    const auto files = filesOf(folder / "a"), others = filesOf(folder / "deep/below/c");
    EXPECT_TRUE(files == filesOf(folder / "b")) << scale << " " << days;
    EXPECT_NE(files.at(support::kCountersDatabase), others.at(support::kCountersDatabase));
    EXPECT_FALSE(files.contains(support::kCountersDatabase + std::string("-shm")));

    const auto yesterday = demo::Device(folder / "a").recorded(kToday - 1, kToday - 1);
    const auto times = static_cast<std::size_t>(scale);
    EXPECT_TRUE(days > 0 || yesterday.scalars.size() == scalarTable().size() * times);
    EXPECT_EQ(yesterday.distributions.size(), distributionTable().size() * times);
    const SampleCounters counters({.seed = 1, .scale = scale, .today = kToday});
    for (const auto& change : counters.ofDay(kToday - 1)) {
      EXPECT_TRUE(change.seconds >= 0 && change.seconds < 86400) << change.key;
    }

    host::Host host({.root = folder / "a"});
    std::vector<std::int32_t> recorded;
    EXPECT_TRUE(host.counters().history()->scalarsForKeyPrefix(
        scalarTable().front().key, INT32_MIN, INT32_MAX,
        [&](auto, auto day, auto, bool&) { recorded.push_back(day); }));
    EXPECT_EQ(recorded.size(), static_cast<std::size_t>((kDaysOfCounters + days) * scale));
    EXPECT_EQ(recorded.front(), kToday - days - kDaysOfCounters);
    EXPECT_EQ(recorded.back(), kToday - 1);
  }
}

TEST(Mkdevice, AFolderThatHoldsAnythingIsLeftAsItIs) {
  support::TemporaryFolder folder;
  folder.write("full/letter", "mine");
  folder.write("file", "mine too");
  Maker maker;
  for (const char* name : {"full", "file", "file/below"}) {
    EXPECT_NE(maker.make(folder / name, {.today = kToday}), "") << name;
  }
  EXPECT_EQ(folder.read("full/letter") + folder.read("file"), "minemine too");
  EXPECT_EQ(std::distance(fs::directory_iterator(folder / "full"), {}), 1);
  fs::create_directory(folder / "empty");
  EXPECT_EQ(maker.make(folder / "empty", {.today = kToday}), "");
}

// An entry that nothing matches is dead; a private key that a prefix catches by mistake leaks.
TEST(Mkdevice, ItsReportHoldsWhatTheWhitelistNamesAndNothingElse) {
  support::TemporaryFolder folder;
  ASSERT_EQ(Maker().make(folder / "root", {.today = kToday}, 3), "");
  demo::Device device(folder / "root");
  ASSERT_EQ(device.logs().size(), 3U);
  const auto log = device.readLog(device.logs().back());
  ASSERT_TRUE(log) << log.error().text;
  const auto& scalars = *log->content.dictionary("PLScalars");
  const auto& distributions = *log->content.dictionary("PLDistributions");

  const auto isTaken = [](Group group) {
    return group != Group::none && group != Group::experiments && group != Group::internalTesting;
  };
  const auto expectReported = [&](const auto& table, const auto& output) {
    for (const auto& row : table) {
      const std::string key = row.key;
      const bool byPrefix = key.starts_with("com.norba.radio.cell.") ||
                            key.starts_with("com.norba.applications.foreground.");
      EXPECT_EQ(output.find(key) != nullptr, isTaken(row.group) || byPrefix) << key;
    }
  };
  expectReported(scalarTable(), scalars);
  expectReported(distributionTable(), distributions);
  for (const WhitelistRow& row : whitelistTable()) {
    const std::string key = row.key;
    // Not of a sample device's, and not of every day's.
    if (key.starts_with("host.") || key.starts_with("datausage.baddata.")) continue;
    if (!isTaken(row.group)) continue;
    const bool scalar =
        row.section == Section::scalarKeys || row.section == Section::scalarPrefixes;
    const bool exact =
        row.section == Section::scalarKeys || row.section == Section::distributionKeys;
    const auto& output = scalar ? scalars : distributions;
    EXPECT_TRUE(std::any_of(output.begin(), output.end(), [&](const auto& entry) {
      return exact ? entry.key == key : entry.key.starts_with(key);
    })) << key;
  }
  EXPECT_FALSE(log->content.dictionary("PLDistributionsHistogram")->empty());
}

// Days that aren't played at their own time, in their order or from the device as it was then.
TEST(Mkdevice, PlayedDaysLeaveWhatTheirRunsWouldHave) {
  support::TemporaryFolder folder;
  ASSERT_EQ(Maker().make(folder / "a", {.today = kToday}, 3), "");
  std::vector<std::string> days, storage;
  for (const auto& [path, bytes] : filesOf(folder / "a")) {
    if (path.find("/StorageStatus.") != path.npos) storage.push_back(bytes);
    if (path.find("structured-") != path.npos) days.push_back(path.substr(path.size() - 16, 10));
  }
  EXPECT_EQ(days, (std::vector<std::string>{"2026-11-18", "2026-11-19", "2026-11-20"}));
  ASSERT_EQ(storage.size(), 1u) << "one a week, in the first run";
  for (const char* text : {"Date: 2026-11-19 ", " morvend[", ";ValidityList[15]:"}) {
    EXPECT_NE(storage[0].find(text), storage[0].npos) << text;
  }

  demo::Device device(folder / "a");
  const auto logs = device.logs();
  ASSERT_EQ(logs.size(), 3u);
  for (std::size_t i = 0; i < logs.size(); ++i) {
    const auto start = device.readLog(logs[i])->content.date("PLStartDate")->secondsSince1970;
    EXPECT_EQ(start, (kToday - 4.0 + static_cast<double>(i)) * 86400);
  }
  host::Host host({.root = folder / "a"});
  EXPECT_EQ(host.services().preferences.QNSPreferencesGetIntegerValue(
                "LastCrashLogSerializationDateInDaysSince1970", "com.norba.pellorand.morvend"),
            kToday - 2);

  const auto received = [](std::int32_t day) {
    const auto usage = networkUsage({.today = day});
    const auto* process = usage.array("Records")->front().as<plist::Dictionary>();
    return process->number("wifiInBytes")->int64Value();
  };
  std::map<std::int32_t, std::int64_t> expected, recorded;
  for (const std::int32_t day : {kToday - 2, kToday - 1}) {
    expected[day] = (received(day) - received(day - 1)) / 1024;
  }
  EXPECT_TRUE(host.counters().history()->scalarsForKeyPrefix(
      "datausage.wifiInKB.com.norba.netconfigd", INT32_MIN, INT32_MAX,
      [&](auto, auto day, auto value, bool&) { recorded[day] = value; }));
  EXPECT_EQ(recorded, expected);
}

using Fields = std::map<std::string, std::uint64_t>;

Fields statisticsOf(const Sample& sample, int hoursAgo) {
  support::freshErrors();
  NANDInfo::GenericParserCxt context;
  const std::string bytes = ftlStatistics(Wear(sample, hoursAgo));
  std::size_t elements = 0;
  for (const NANDInfo::FTLKey& row : NANDInfo::FTLKeyTable()) elements += row.elements;
  EXPECT_EQ(NANDInfo::ZMCFTLParseBufferToCxt(&context, std::as_bytes(std::span(bytes))), elements);
  EXPECT_STREQ(NANDInfo::GetAPIErrorMessage(), "NA");
  const auto fields = support::fieldsOf(context);
  return {fields.begin(), fields.end()};
}

// A family row that swallows a counter by mistake shows as a relation that doesn't hold.
TEST(MkdeviceController, ItsCountersAgreeWithEachOtherAndOnlyGrow) {
  const char* const kAscending[][4] = {
      {"hostWrites", "nandWrites"},
      {"hostReads", "nandReads"},
      {"hostWriteXacts", "hostWritesDyn", "hostWrites"},
      {"uncleanBoots", "shutdowns", "boots"},
      {"intermediatePartitionStart", "userPartitionStart", "numVirtualBlocks"},
      {"IND_pool_free", "IND_pool_count"},
      {"numFreeVirtualBlocks", "numVirtualBlocks"},
      {"minSkinnyPECycles", "averageSkinnyPECycles", "maxSkinnyPECycles"},
      {"averageTLCPECycles", "averageSLCPECycles", "maxHighEnduranceBlockErases"},
      {"eanMinBootReadMBPerSec", "eanAvgBootReadMBPerSec"},
      {"averageGracefulBootTimeMs", "maxGracefulBootTimeMs"},
      {"avgBgInitTimeMs", "maxBgInitTimeMs"},
  };
  for (std::uint64_t seed = 1; seed <= 12; ++seed) {
    SCOPED_TRACE(seed);
    const Sample sample{.seed = seed, .today = kToday};
    Fields newer = statisticsOf(sample, 0);
    for (const auto& names : kAscending) {
      for (int i = 1; i < 4 && names[i] != nullptr; ++i) {
        EXPECT_LT(newer.at(names[i - 1]), newer.at(names[i])) << names[i];
      }
    }
    for (const auto& [name, value] : newer) {
      const bool isPercent = name.find("ercent") != name.npos || name.find("Precent") != name.npos;
      EXPECT_TRUE(!isPercent || value <= 100) << name << " " << value;
      EXPECT_LE(value, std::uint64_t{1} << 56) << name;
    }
    const std::uint64_t formatted = newer.at("utilFormatTime");
    EXPECT_TRUE(formatted > 1'600'000'000 && formatted < newer.at("wallTime")) << formatted;
    for (const int hours : {4, 24, 168, 720}) {
      const Fields older = statisticsOf(sample, hours);
      EXPECT_LT(older.at("gcWrites"), newer.at("gcWrites"));
      EXPECT_EQ(older.at("magazineInstanceMeta") >> 24,
                kToday * 86400ull - static_cast<unsigned>(hours) * 3600ull);
      for (const auto& [name, value] : older) {
        EXPECT_TRUE(value <= newer.at(name) || name.starts_with("vcurve_")) << name;
      }
      newer = older;
    }
  }
}

TEST(MkdeviceController, EveryChipsTelemetryIsReadInItsLayout) {
  using NANDInfo::ChipKind;
  const struct {
    const char* name;
    ChipKind kind;
    NANDInfo::CounterConverter* convert;
  } rows[] = {{"qm7", ChipKind::QM7, NANDInfo::parseCountersAlgoGeneric},
              {"qm8", ChipKind::QM8, NANDInfo::parseCountersAlgoGenericQ8},
              {"1x-sandisk", ChipKind::other, NANDInfo::parseCounters1xSandisk},
              {"1x-hynix", ChipKind::other, NANDInfo::parseCounters1xHynix},
              {"1y", ChipKind::other, NANDInfo::parseCounters1y}};
  for (const auto& row : rows) {
    SCOPED_TRACE(row.name);
    support::TemporaryFolder folder;
    ASSERT_EQ(Maker().make(folder.path(), {.today = kToday, .chip = chipNamed(row.name)}), "");
    {
      host::Host host({.root = folder.path()});
      EXPECT_TRUE(NANDInfo::DumpStorageStructuredLog(host.services(), false));
    }
    std::string logs;
    for (const auto& file : fs::directory_iterator(folder / "var/spool/morvend/structured")) {
      logs += folder.read(file.path().lexically_relative(folder.path()).string());
    }
    for (int list = 0; list < 3; ++list) {
      const auto bytes = folder.read(base::format("device/controller/telemetry-%d.bin", list));
      const auto channels =
          NANDInfo::parseTelemetryList(std::as_bytes(std::span(bytes)), kChannels);
      for (const auto& channel : *channels) {
        std::string log;
        plist::appendJSON(log, NANDInfo::telemetryLog(channel, row.kind, row.convert));
        EXPECT_NE(logs.find(log), logs.npos) << list;
      }
    }
  }
  EXPECT_EQ(std::size(rows), std::size(kChipNames));
}

}  // namespace
