#include <gtest/gtest.h>

#include <map>
#include <set>

#include "daemon/context/DeviceContext.h"
#include "platform/host/Host.h"
#include "report/PLReport.h"
#include "support/TemporaryFolder.h"
#include "tools/demo/Device.h"
#include "tools/mkdevice/DeviceMaker.h"
#include "tools/mkdevice/Vocabulary.h"

namespace {

namespace fs = std::filesystem;
using namespace mkdevice;
using platform::host::CounterChange;

constexpr std::int32_t kToday = 20779;

struct Maker {
  std::string make(const fs::path& folder, const Sample& sample) {
    warnings = 0;
    const MakingOptions options{folder.string(), sample, "/nowhere/module.so"};
    return makeDevice(options, {.progress = [](const std::string&) {},
                                .warning = [this](const std::string&) { ++warnings; }});
  }
  int warnings = 0;
};

// Path below the folder to bytes, of everything but the database.
std::map<std::string, std::string> filesOf(const fs::path& folder) {
  std::map<std::string, std::string> files;
  for (const auto& entry : fs::recursive_directory_iterator(folder)) {
    const std::string path = entry.path().lexically_relative(folder).string();
    if (!entry.is_regular_file() || path.find("PLDataStore") != std::string::npos) continue;
    std::ifstream file(entry.path(), std::ios::binary);
    files[path] = {std::istreambuf_iterator<char>(file), {}};
    EXPECT_EQ(entry.status().permissions(), fs::perms::owner_read | fs::perms::owner_write) << path;
  }
  return files;
}

bool ascending(std::span<const double> bounds) {
  return std::adjacent_find(bounds.begin(), bounds.end(), std::greater_equal<>()) == bounds.end();
}

TEST(MkdeviceTables, EveryRowMakesSense) {
  std::set<std::string> keys;
  for (const ScalarRow& row : scalarTable()) {
    EXPECT_TRUE(keys.insert(row.key).second) << row.key;
    EXPECT_GT(row.typical, 0) << row.key;
    EXPECT_TRUE(row.options.intervals.empty()) << row.key;
    EXPECT_LE(row.options.significantFigures, 4U) << row.key;
  }
  for (const DistributionRow& row : distributionTable()) {
    EXPECT_TRUE(keys.insert(row.key).second) << row.key;
    EXPECT_TRUE(row.samples >= 50 && row.samples <= 300) << row.key;
    EXPECT_TRUE(row.spread > 0 && row.spread < 1) << row.key;
    EXPECT_EQ(row.options.bucketInterval + row.options.significantFigures, 0U) << row.key;
    EXPECT_TRUE(ascending(row.options.intervals)) << row.key;
  }
  std::set<std::tuple<Group, Section, std::string>> entries;
  for (const WhitelistRow& row : whitelistTable()) {
    EXPECT_TRUE(entries.insert({row.group, row.section, row.key}).second) << row.key;
    const bool scalar =
        row.section == Section::scalarKeys || row.section == Section::scalarPrefixes;
    EXPECT_TRUE(scalar ? row.options.intervals.empty() : ascending(row.options.intervals))
        << row.key;
  }
}

// Weekday rhythm may lower a day's values, but nothing may be lost or fall outside its day.
TEST(MkdeviceCounters, ADayHoldsEveryCounterAndItsSamplesInOrder) {
  for (const int scale : {1, 3}) {
    const SampleCounters counters({.seed = 7, .scale = scale, .today = kToday});
    std::set<std::string_view> scalars;
    std::map<std::string_view, std::vector<std::int32_t>> seconds;
    for (const CounterChange& change : counters.ofDay(kToday - 1)) {
      EXPECT_EQ(change.day, kToday - 1);
      if (change.kind == CounterChange::Kind::set) {
        EXPECT_TRUE(scalars.insert(change.key).second) << change.key;
        EXPECT_GE(change.amount, 0) << change.key;
      } else {
        seconds[change.key].push_back(change.seconds);
      }
    }
    const auto times = static_cast<std::size_t>(scale);
    EXPECT_EQ(scalars.size(), scalarTable().size() * times);
    EXPECT_EQ(seconds.size(), distributionTable().size() * times);
    for (const auto& [key, ofKey] : seconds) {
      EXPECT_TRUE(ofKey.size() >= 40 && ofKey.size() <= 300) << key;
      EXPECT_TRUE(std::is_sorted(ofKey.begin(), ofKey.end())) << key;
      EXPECT_TRUE(ofKey.front() >= 0 && ofKey.back() < 86400) << key;
    }
  }
}

TEST(Mkdevice, TheSameSeedOnTheSameDayMakesTheSameDevice) {
  support::TemporaryFolder folder;
  Maker maker;
  for (const char* name : {"a", "b", "deep/below/c"}) {
    const std::uint64_t seed = name[0] == 'd' ? 2 : 1;
    ASSERT_EQ(maker.make(folder / name, {.seed = seed, .today = kToday}), "") << name;
    EXPECT_EQ(maker.warnings, 1) << "the missing module";
  }
  EXPECT_EQ(filesOf(folder / "a"), filesOf(folder / "b"));
  EXPECT_NE(filesOf(folder / "a"), filesOf(folder / "deep/below/c"));

  const auto dump = [](const std::string& root) {
    platform::host::Host host({.root = root});
    const std::string home = "/var/mobile";
    host.keepCountersBelow([&home] { return &home; });
    std::map<std::string, std::vector<double>> rows;
    const auto history = host.counters().history();
    history->scalarsForKeyPrefix(
        "", INT32_MIN, INT32_MAX, [&](auto key, auto day, auto value, bool&) {
          rows[std::string(key)].insert(rows[std::string(key)].end(), {double(day), double(value)});
        });
    history->distributionsForKeyPrefix(
        "", INT32_MIN, INT32_MAX, [&](auto key, auto day, auto& samples, bool&) {
          auto& row = rows[std::string(key)];
          row.push_back(day);
          for (auto block = samples.getNextValues(); !block.values.empty();
               block = samples.getNextValues()) {
            row.insert(row.end(), block.values.begin(), block.values.end());
          }
        });
    return rows;
  };
  const auto rows = dump(folder / "a");
  EXPECT_EQ(rows, dump(folder / "b"));
  EXPECT_NE(rows, dump(folder / "deep/below/c"));
  const auto& days = rows.at(scalarTable().front().key);
  EXPECT_EQ(days.size(), 2U * kDaysOfCounters);
  EXPECT_EQ(days[0], kToday - kDaysOfCounters);
  EXPECT_EQ(days[days.size() - 2], kToday - 1);
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
  ASSERT_EQ(Maker().make(folder / "root", {.today = kToday}), "");
  {
    platform::host::Host host({.root = folder / "root", .lowestLevel = platform::LogLevel::error});
    morvend::DeviceContext context(host.platform());
    host.keepCountersBelow([&context] { return context.GetHomeDirectoryPath(); });
    report::PLReport(host.platform(), context).writeLogForYesterday(kToday - 1, nullptr);
  }
  demo::Device device(folder / "root");
  ASSERT_EQ(device.logs().size(), 1U);
  const auto log = device.readLog(device.logs().front());
  ASSERT_TRUE(log) << log.error;
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
    if (!isTaken(row.group) || key.starts_with("host.")) continue;
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

}  // namespace
