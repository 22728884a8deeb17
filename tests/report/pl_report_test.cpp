// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "report/PLReport.h"

#include <gtest/gtest.h>

#include <functional>
#include <initializer_list>
#include <map>
#include <new>
#include <system_error>
#include <vector>

#include "platform/InstalledApplications.h"
#include "platform/Kernel.h"
#include "plist/PropertyList.h"
#include "report/Collectors.h"
#include "report/KernelCounters.h"
#include "support/TestPlatform.h"

namespace {

// Allocations that report failure instead of throwing fail while this is set.
bool allocationsFail = false;

}  // namespace

#ifdef __has_feature
#if __has_feature(thread_sanitizer)
#define ALLOCATIONS_ARE_THE_SANITIZERS
#endif
#endif
#ifndef ALLOCATIONS_ARE_THE_SANITIZERS
void* operator new[](std::size_t size, const std::nothrow_t&) noexcept {
  return allocationsFail ? nullptr : ::operator new[](size);
}
#endif

namespace report {
namespace {

using plist::Array;
using plist::Dictionary;
using plist::Value;
constexpr char kDomain[] = "com.norba.pellorand.morvend";
constexpr std::int32_t kDay = 20000;

class PLReportTest : public ::testing::Test {
 protected:
  PLReportTest() {
    platform.clock.secondsSince1970 = 20001 * 86400.0 + 4 * 3600;
    platform.device.languages = {"de-AT", "en"};
    platform.device.matches = {"de"};
    platform.device.country = "AT";
    platform.device.versionText = "17.4 (21E219)";
    platform.setWhitelist(
        {{"Group",
          Dictionary{{"ScalarKeys",
                      Dictionary{{"exact", Dictionary()}, {"rounded", Dictionary{{"sig_fig", 1}}}}},
                     {"ScalarKeyPrefixes", Dictionary{{"p.", Dictionary{{"bucket_interval", 10}}}}},
                     {"DistributionKeys",
                      Dictionary{{"plain", Dictionary()},
                                 {"counted",
                                  Dictionary{{"intervals", Array{Value(10), Value(100)}}}}}}}}});
  }

  base::Result<void> written;

  // What the last log holds then.
  Dictionary write(const ActivatedAppInfo* appInfo = nullptr) {
    morvend::DeviceContext context(platform.platform);
    written = PLReport(platform.platform, context).writeLogForYesterday(kDay, appInfo);
    const auto& logs = platform.submission.logs;
    return logs.empty() ? Dictionary() : platform.parse(logs.back().contents);
  }

  std::string digestOfWhitelist() {
    morvend::DeviceContext context(platform.platform);
    return PLConfig::init(platform.platform, context)->configFileDigest();
  }

  // The report's own collectors, over a whitelist of these keys.
  Dictionary collect(std::initializer_list<const char*> keys,
                     const std::function<void(Sections&)>& collector) {
    platform.whitelistScalars(keys);
    morvend::DeviceContext context(platform.platform);
    const PLReport report(platform.platform, context);
    Sections sections = report.emptySections();
    collector(sections);
    return sections.scalars;
  }

  support::TestPlatform platform;
  const std::function<void(Sections&)> applications = [this](Sections& s) {
    addInstalledAppInfo(s, platform.device, platform.eventra);
  };
  const std::function<void(Sections&)> uptime = [this](Sections& s) {
    reportCPUUptime(s, platform.kernel, platform.log);
  };
  const std::function<void(Sections&)> memory = [this](Sections& s) {
    reportVMStats(s, platform.kernel);
  };
};

TEST_F(PLReportTest, WritesTheWholeLog) {
  platform.history.scalars = {{{kDay - 2, "exact"}, 1},     {{kDay - 1, "exact"}, 2},
                              {{kDay, "exact"}, 3},         {{kDay, "p.q"}, 15},
                              {{kDay - 1, "rounded"}, 987}, {{kDay, "secret"}, 4},
                              {{kDay + 1, "exact"}, 5}};
  platform.history.distributions = {{{kDay, "counted"}, {10, 11, 1000}},
                                    {{kDay, "plain"}, {1, 2, 3, 4}},
                                    {{kDay, "hidden"}, {1}}};
  const ActivatedAppInfo apps{Dictionary{{"bundle", "com.x"}}};
  write(&apps);
  ASSERT_EQ(platform.submission.logs.size(), 1u);
  const auto& log = platform.submission.logs[0];
  EXPECT_EQ(log.type, "193");
  EXPECT_EQ(log.name, "log-pellorand");
  EXPECT_EQ(log.options, (Dictionary{{"previous_os_version", "<unknown>"}}));
  const Dictionary expected{
      {"PLCrashLogVersion", 1},
      {"PLStartDate", plist::Date{20000 * 86400.0}},
      {"PLLogCreationDate", plist::Date{20001 * 86400.0 + 4 * 3600}},
      {"PLMetadata", Dictionary{{"PLUserInterfaceLanguage", "de"},
                                {"PLPreferredUserInterfaceLanguage", "de-AT"},
                                {"PLUserSetRegionFormat", "AT"}}},
      {"PLScalars", Dictionary{{"exact", 3}, {"rounded", 1000}, {"p.q", 20}}},
      {"PLDistributions",
       Dictionary{{"counted", Array{10.0, 1000.0, 1021 / 3.0, 652740.6666666667, 3}},
                  {"plain", Array{1.0, 4.0, 2.5, 5.0, 4}}}},
      {"PLDistributionsHistogram",
       Dictionary{{"counted", Dictionary{{"(-inf, 10]", 1}, {"(10, 100]", 1}, {"(100, inf)", 1}}}}},
      {"PLTasking", Array()},
      {"PLTaskID", "(no tasking id)"},
      {"PLTaskDigest", "(no tasking digest)"},
      {"PLWhitelistDigest", digestOfWhitelist()},
      {"PLActivatedAppInfo", Array{Dictionary{{"bundle", "com.x"}}}}};
  EXPECT_EQ(log.contents, *plist::writeXML(expected));
}

// Nothing is let through: no log, no collector, no record, but a line that says why.
TEST_F(PLReportTest, SaysWhyThereIsNoReport) {
  const struct {
    std::map<platform::fakes::FakeHistory::RowKey, std::int64_t> scalars;
    std::map<platform::fakes::FakeHistory::RowKey, std::vector<double>> distributions;
    const char* why;
    base::Result<void> outcome{};
  } rows[] = {
      {{}, {}, "the counters can't be read", base::Error{"broken"}},
      {{{{kDay - 2, "exact"}, 1}, {{kDay + 1, "exact"}, 1}},
       {},
       "no counter was recorded on that day or the day before"},
      {{{{kDay - 1, "secret"}, 1}, {{kDay, "secret"}, 2}, {{kDay, "plain"}, 3}},
       {{{kDay, "exact"}, {1}}},
       "the whitelist names none of the 3 counters"},
  };
  for (const auto& row : rows) {
    platform.history.scalars = row.scalars;
    platform.history.distributions = row.distributions;
    platform.history.outcome = row.outcome;
    platform.log.clear();
    write();
    EXPECT_EQ(static_cast<bool>(written), static_cast<bool>(row.outcome)) << "is one lost?";
    std::vector<std::string> lines{"info: writing pellorand log. yesterday=20000"};
    if (!row.outcome) lines.push_back("error: broken");
    lines.push_back(std::string("default: no report for day 20000: ") + row.why);
    EXPECT_EQ(platform.log.lines(), lines);
  }
  platform.files.contents.clear();
  write();
  EXPECT_EQ(platform.log.lines().back(),
            "default: no report for day 20000: the whitelist couldn't be read");
  EXPECT_TRUE(platform.journal.empty());
}

// Counters of two days and the report's own, each key once; those that are named don't count.
TEST_F(PLReportTest, SaysHowManyKeysAnInternalBuildAddsToTheWhitelist) {
  platform.history.scalars = {
      {{kDay - 1, "secret"}, 1}, {{kDay, "secret"}, 2}, {{kDay, "exact"}, 3}, {{kDay, "p.q"}, 4}};
  platform.history.distributions = {{{kDay, "hidden"}, {1}}, {{kDay, "plain"}, {1}}};
  write();
  EXPECT_EQ(platform.log.count("internal build"), 0);
  platform.device.internalBuild = true;
  const std::size_t own = write().dictionary("PLScalars")->size() - 3;
  EXPECT_GT(own, 5u);
  EXPECT_EQ(platform.log.count("default: reporting " + std::to_string(own + 2) +
                               " keys that no whitelist entry names: this is an internal build"),
            1);
}

TEST_F(PLReportTest, RecordsTheVersionOnlyWithALog) {
  platform.history.distributions = {{{kDay, "counted"}, {}}};  // an empty one is a report
  const struct {
    const char* version;
    std::optional<Dictionary> options;
  } rows[] = {{"17.4 (21E219)", Dictionary{{"previous_os_version", "<unknown>"}}},
              {"17.4 (21E219)", std::nullopt},
              {"17.5", Dictionary{{"previous_os_version", "17.4 (21E219)"}}},
              {"17.5", std::nullopt}};
  for (const auto& row : rows) {
    platform.device.versionText = row.version;
    platform.journal.clear();
    write();
    EXPECT_EQ(platform.submission.logs.back().options, row.options);
    EXPECT_EQ(platform.preferences.mobile(kDomain, "LastOSVersion"), Value(row.version));
    // On disk before the log is submitted.
    std::vector<std::string> done{"submit log-pellorand"};
    if (row.options) {
      const std::string domain = kDomain;
      done.insert(done.begin(), {"set mobile/" + domain + "/LastOSVersion = " + row.version,
                                 "synchronize " + domain});
    }
    EXPECT_EQ(platform.journal, done);
  }
}

TEST_F(PLReportTest, GoesOnWithoutAHistogramWhenMemoryIsShort) {
#ifdef ALLOCATIONS_ARE_THE_SANITIZERS
  GTEST_SKIP();
#endif
  platform.history.distributions = {{{kDay, "counted"}, {1, 2}}};
  allocationsFail = true;
  const Dictionary log = write();
  allocationsFail = false;
  EXPECT_EQ(platform.log.count("default: Couldn't allocate histCounts for key counted. Will not "
                               "calculate histogram values"),
            1);
  EXPECT_EQ(log.dictionary("PLDistributions")->size(), 1u);
  EXPECT_TRUE(log.dictionary("PLDistributionsHistogram")->empty());
}

// What was read before the failure counts once; a failure that stays is said once.
TEST_F(PLReportTest, ReadsTheDayAnewWhenTheHistoryFailsAndMayNotFailAgain) {
  const base::Error passing{"busy", std::errc::resource_unavailable_try_again};
  const base::Result<void> done;
  const struct {
    std::vector<base::Result<void>> outcomes;
    std::size_t left;  // of them
  } rows[] = {{{passing}, 0},
              {{done, passing}, 0},
              {{done, passing, passing}, 0},
              {{passing, passing, passing, done}, 1},
              {{base::Error{"broken"}, done}, 1}};
  platform.history.scalars = {{{kDay, "exact"}, 3}};
  platform.history.distributions = {{{kDay, "counted"}, {10, 11, 1000}}};
  const Dictionary expected = write();
  for (const auto& row : rows) {
    platform.log.clear();
    platform.history.firstOutcomes = row.outcomes;
    const Dictionary log = write();
    EXPECT_EQ(platform.history.firstOutcomes.size(), row.left);
    EXPECT_EQ(platform.log.count("error: "), row.left);
    for (const char* section : {"PLScalars", "PLDistributions", "PLDistributionsHistogram"}) {
      EXPECT_TRUE(row.left > 0 || *log.find(section) == *expected.find(section)) << section;
    }
  }
}

// A later row without samples takes the histogram of an earlier day's row away.
TEST_F(PLReportTest, ReplacesEarlierRowsWhole) {
  platform.history.distributions = {{{kDay - 1, "counted"}, {1, 2}}, {{kDay, "counted"}, {}}};
  const Dictionary log = write();
  EXPECT_TRUE(log.dictionary("PLDistributionsHistogram")->empty());
  EXPECT_EQ(log.dictionary("PLDistributions")->array("counted")->at(4), Value(0));
}

TEST_F(PLReportTest, CountsApplicationsOnlyIfSomebodyWantsThem) {
  using Type = platform::InstalledApplications::BundleType;
  constexpr char kUser[] = "com.norba.tarvenn.numThirdPartyApps";
  platform.device.bundles = {Type::user, Type::system, Type::user};
  platform.eventra.everyEventIsUsed = false;
  EXPECT_TRUE(collect({"other"}, applications).empty());
  EXPECT_EQ(platform.device.enumerations, 0);
  EXPECT_EQ(collect({kUser}, applications), (Dictionary{{kUser, std::int64_t{2}}}));
  EXPECT_TRUE(platform.eventra.events.empty());
  platform.eventra.everyEventIsUsed = true;
  EXPECT_TRUE(collect({"other"}, applications).empty());
  ASSERT_EQ(platform.eventra.events.size(), 1u);
  EXPECT_EQ(platform.eventra.events[0].first, "com.norba.tarvenn.appInstalls");
  EXPECT_EQ(platform.eventra.events[0].second,
            (Dictionary{{"numThirdPartyApps", std::int64_t{2}}, {"numAllApps", std::int64_t{3}}}));
}

TEST_F(PLReportTest, FillsUnknownLanguages) {
  platform.device.languages.clear();
  platform.device.matches.clear();
  platform.device.country.reset();
  platform.history.scalars = {{{kDay, "exact"}, 3}};
  EXPECT_EQ(*write().dictionary("PLMetadata"),
            (Dictionary{{"PLUserInterfaceLanguage", "<unknown>"},
                        {"PLPreferredUserInterfaceLanguage", "<unknown>"}}));
}

TEST_F(PLReportTest, TellsMinutesSinceBoot) {
  constexpr char kKey[] = "com.norba.usage.cur_boot_session_cpu_uptime";
  const struct {
    std::optional<platform::Kernel::Timebase> ratio;
    std::uint64_t ticks;
    std::int64_t minutes;
  } rows[] = {{{{1, 1}}, 90'000'000'000, 1},
              {{{125, 3}}, 24'000'000ull * 60 * 10 + 12'000'000, 10},
              {{{1, 1}}, 0, 0},
              {{{4294967295, 1}}, ~std::uint64_t{0}, 1320469374930293248},
              {{}, 1, -1},
              {{{1, 0}}, 1, -1}};
  for (const auto& row : rows) {
    platform.kernel.ratio = row.ratio;
    platform.kernel.ticks = row.ticks;
    const auto scalars = collect({kKey}, uptime);
    const std::int64_t minutes = scalars.number(kKey)->int64Value();
    EXPECT_DOUBLE_EQ(static_cast<double>(minutes), static_cast<double>(row.minutes));
  }
  EXPECT_EQ(platform.log.count("error: Couldn't retrieve mach_timebase_info"), 2);
}

// The whole of what the report adds by itself, in its order: each value from its own source, none
// cut to 32 bits that has more.
TEST_F(PLReportTest, AddsEachOfItsOwnValuesFromItsSource) {
  using Type = platform::InstalledApplications::BundleType;
  const struct {
    std::string key, kernelName;  // no name: from elsewhere; a name's beginning: the key's end
    std::uint64_t stored;
    std::int64_t reported;
  } rows[] = {
      {"tarvenn.numAllInstalledApps", "", 0, 3},
      {"tarvenn.numThirdPartyApps", "", 0, 2},
      {"quenset.prnd.database.size", "", 0, 7},
      {"quenset.prnd.database.corruptions", "", 0, 0},
      {"usage.cur_boot_session_cpu_uptime", "", 0, 99},
      {"kernel.vmtc_total", "vm.", 101, 101},
      {"kernel.vmtc_one_bit_flip", "vm.", 102, 102},
      {"kernel.vmtc_not_found", "vm.", 103, 103},
      {"kernel.vmtc_1_byte", "vm.", 104, 104},
      {"kernel.vmtc_2_byte", "vm.", 105, 105},
      {"kernel.vmtc_4_byte", "vm.", 106, 106},
      {"kernel.vmtc_8_byte", "vm.", 107, 107},
      {"kernel.vmtc_16_byte", "vm.", 108, 108},
      {"kernel.vmtc_32_byte", "vm.", 109, 109},
      {"kernel.vmtc_64_byte", "vm.", 110, 110},
      {"kernel.vmtc_128_byte", "vm.", 111, 111},
      {"kernel.vmtc_256_byte", "vm.", 112, 112},
      {"kernel.vmtc_undiagnosed", "vm.", 113, 113},
      {"kernel.memorystatus_freeze_count", "kern.", 114, 114},
      {"kernel.memorystatus_freeze_pageouts", "kern.", 5ull << 32, 5ll << 32},  // 81920 GiB
      {"memorystatus_freezer_thaws_per_gb", "kern.memorystatus_thaw_count_since_boot",
       3 * 81920ull << 32, 3ll << 32},
      {"kernel.memorystatus_freeze_budget_pages_remaining", "kern.", 1ull << 40, 1ll << 40},
      {"kernel.memorystatus_thaw_count", "kern.", 115, 115},
      {"kernel.swapusage", "vm.", 7ull << 40, 7ll << 40},
      {"memorystatus_freezer_error_no_compressor_space_count", "kern.", 2ull << 40, 25},
      {"memorystatus_freezer_error_no_swap_space_count", "kern.", 3ull << 40, 37},
      {"memorystatus_freezer_error_below_min_pages_count", "kern.", 4ull << 40, 50},
      {"memorystatus_freezer_error_low_probability_of_use_count", "kern.", 5ull << 40, 62},
      {"memorystatus_freezer_error_other_count", "kern.", 6ull << 40, 75},
      {"memorystatus_freezer_process_considered_count", "kern.", 8ull << 40, 8ll << 40},
      {"memorystatus_freezer_skipped_full_count", "kern.", 3ull << 33, 75},
      {"memorystatus_freezer_thaw_percentage", "kern.", 9ull << 40, 9ll << 40},
      {"memorystatus_freezer_refreeze_average", "kern.memorystatus_freezer_bytes_refrozen",
       120ull << 40, 10ll << 40},
  };
  auto& integers = platform.kernel.integers;
  integers = {{"kern.memorystatus_freezer_below_threshold_count", 4ull << 33},
              {"kern.memorystatus_freezer_refreeze_count", 12}};
  std::vector<std::string> expected{"exact 1"}, reported;
  for (const auto& row : rows) {
    const std::string end = row.key.substr(row.key.find('.') + 1);
    integers[row.kernelName + (row.kernelName.ends_with('.') ? end : "")] = row.stored;
    expected.push_back("com.norba." + row.key + " " + std::to_string(row.reported));
  }
  platform.device.bundles = {Type::user, Type::system, Type::user};
  platform.files.contents["/var/mobile/Library/Pelloran/PLDataStore.sqlitedb"].resize((8 << 20) -
                                                                                      1);
  platform.kernel.ticks = 99'000'000'000ull * 60 + 1;
  platform.setWhitelist(
      {{"Group", Dictionary{{"ScalarKeys", Dictionary{{"exact", Dictionary()}}},
                            {"ScalarKeyPrefixes", Dictionary{{"com.norba.", Dictionary()}}}}}});
  platform.history.scalars = {{{kDay, "exact"}, 1}};
  const Dictionary log = write();
  for (const auto& [key, value] : *log.dictionary("PLScalars")) {
    reported.push_back(key + " " + description(value));
  }
  EXPECT_EQ(reported, expected);
}

// Every gate of the memory statistics, with the kernel values that make it what it is.
TEST_F(PLReportTest, ReportsMemoryStatisticsBehindTheirGates) {
  using Integers = std::map<std::string, std::uint64_t, std::less<>>;
  const std::string frozen = "kern.memorystatus_freeze_pageouts",
                    thaws = "kern.memorystatus_thaw_count_since_boot",
                    considered = "kern.memorystatus_freezer_process_considered_count",
                    other = "kern.memorystatus_freezer_error_other_count",
                    skipped = "kern.memorystatus_freezer_skipped_full_count",
                    refreezes = "kern.memorystatus_freezer_refreeze_count",
                    refrozen = "kern.memorystatus_freezer_bytes_refrozen";
  const struct {
    const char* key;
    Integers kernel;
    std::optional<std::int64_t> expected;
  } rows[] = {
      {"kernel.vmtc_2_byte", {{"vm.vmtc_total", 0}, {"vm.vmtc_2_byte", 5}}, {}},
      {"kernel.vmtc_2_byte", {{"vm.vmtc_2_byte", 5}}, {}},
      {"kernel.vmtc_2_byte", {{"vm.vmtc_total", 1}}, 4294967295},
      {"kernel.memorystatus_freeze_count", {}, 4294967295},
      {"kernel.memorystatus_freeze_count", {{"kern.memorystatus_freeze_count", 0x1'0000'0007}}, 7},
      {"kernel.memorystatus_freeze_pageouts", {}, {}},
      {"memorystatus_freezer_thaws_per_gb", {{frozen, 262143}, {thaws, 9}}, {}},
      {"memorystatus_freezer_thaws_per_gb", {{frozen, 262144 * 2}, {thaws, 9}}, 4},
      {"memorystatus_freezer_thaws_per_gb", {{frozen, 262144}}, INT64_MAX},
      {"kernel.memorystatus_freeze_budget_pages_remaining", {}, -1},
      {"kernel.memorystatus_thaw_count", {}, 4294967295},
      {"kernel.swapusage", {}, -1},
      {"memorystatus_freezer_error_other_count", {{other, 5}}, {}},
      {"memorystatus_freezer_error_other_count", {{considered, 3}, {other, 2}}, 66},
      {"memorystatus_freezer_error_other_count", {{considered, 0}, {other, 2}}, INT64_MAX},
      {"memorystatus_freezer_error_other_count", {{considered, 0}, {other, 0}}, 0},
      {"memorystatus_freezer_error_other_count", {{considered, 100}}, INT64_MAX},
      {"memorystatus_freezer_process_considered_count", {{considered, ~0ull}}, -1},
      {"memorystatus_freezer_skipped_full_count", {{skipped, 2}}, {}},
      {"memorystatus_freezer_thaw_percentage", {}, -1},
      {"memorystatus_freezer_refreeze_average", {{refreezes, 9}, {refrozen, 90}}, {}},
      {"memorystatus_freezer_refreeze_average", {{refreezes, 10}, {refrozen, 99}}, 9},
      {"memorystatus_freezer_refreeze_average", {{refreezes, 16}}, (1ll << 60) - 1},
      {"memorystatus_freezer_refreeze_average", {{refreezes, ~0ull}}, {}},
  };
  for (const auto& row : rows) {
    platform.kernel.integers = row.kernel;
    const std::string key = std::string("com.norba.") + row.key;
    const auto scalars = collect({key.c_str()}, memory);
    const auto* number = scalars.number(key);
    EXPECT_EQ(number ? std::optional(number->int64Value()) : std::nullopt, row.expected) << row.key;
  }
}

TEST_F(PLReportTest, ReadsGatesAlwaysAndValuesOnlyWhenWhitelisted) {
  for (const KernelCounter& row : kTagCheckCounters) platform.kernel.integers[row.name] = 1;
  collect({"com.norba.kernel.vmtc_1_byte"}, memory);
  EXPECT_EQ(platform.kernel.reads,
            (std::vector<std::string>{"vm.vmtc_total", "vm.vmtc_1_byte",
                                      "kern.memorystatus_freeze_pageouts",
                                      "kern.memorystatus_freezer_process_considered_count",
                                      "kern.memorystatus_freezer_below_threshold_count",
                                      "kern.memorystatus_freezer_refreeze_count"}));
}

}  // namespace
}  // namespace report
