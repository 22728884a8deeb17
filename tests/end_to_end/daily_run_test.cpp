// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The built programs, run by hand or by a timer.

#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <thread>

#include "end_to_end/Device.h"
#include "host/Host.h"
#include "support/BinaryPropertyList.h"
#include "support/TemporaryFolder.h"

namespace end_to_end {
namespace {

constexpr char kGateRecord[] = "LastCrashLogSerializationDateInDaysSince1970";

bool holds(const Lines& lines, const std::string& text) {
  return std::any_of(lines.begin(), lines.end(),
                     [&](const std::string& line) { return line.find(text) != std::string::npos; });
}

TEST(DailyRun, SubmitsTheDayOnceAndLeavesTheRecordsBehind) {
  Device device;
  device.fill();
  const std::string day = std::to_string(device.today() - 1);
  const auto first = device.run("morvend", {"-d"});
  EXPECT_EQ(first.status, 0);
  const std::string found = "NANDInfo: findNandExporter: Controller found: NorbaQRT3NVMeController";
  const std::string copy = "NANDInfo: CopyNANDInfoWithOptions: ";
  EXPECT_EQ(linesOf(first.standardError),
            (Lines{"morvend started", "daily tasks for day " + day, found, found, found,
                   copy + "obtaining FTL data for PRND", found, copy + "returning PRND dictionary",
                   "OS change since last run ((null) -> A1)", "morvend ended"}));
  ASSERT_EQ(device.dailyLogs().size(), 1u);
  const Dictionary log = device.dailyLogs()[0];
  Dictionary expected = device.expectedSections();
  expected.set("PLCrashLogVersion", 1);
  expected.set("PLLogCreationDate", *log.find("PLLogCreationDate"));
  expected.set("PLMetadata", Dictionary{{"PLUserInterfaceLanguage", "de"},
                                        {"PLPreferredUserInterfaceLanguage", "de-AT"},
                                        {"PLUserSetRegionFormat", "AT"}});
  // The tasking is applied after the report.
  expected.set("PLTasking", Array());
  expected.set("PLTaskID", "(no tasking id)");
  expected.set("PLTaskDigest", "(no tasking digest)");
  expected.set("PLWhitelistDigest", *log.find("PLWhitelistDigest"));
  EXPECT_EQ(log, expected);
  EXPECT_EQ(log.text("PLWhitelistDigest")->size(), 32u);
  const Lines spool = device.names(kSubmitted);
  ASSERT_EQ(spool.size(), 4u);
  EXPECT_TRUE(spool[0].starts_with("StorageStatus.165."));
  ASSERT_EQ(device.storageLogs().size(), 1u);
  EXPECT_TRUE(device.storageLogs()[0].ends_with(";ValidityList[0]:5,6;ValidityList[1]:7\n"));
  EXPECT_EQ(spool[2], spool[1] + ".options.plist");
  EXPECT_EQ(spool[3], "structured-2020-01-01.jsonl");
  EXPECT_EQ(device.readPropertyList(std::string(kSubmitted) + "/" + spool[2]),
            Value(Dictionary{{"previous_os_version", "<unknown>"}}));
  EXPECT_EQ(device.record(kGateRecord), Value(device.today() - 1));
  EXPECT_EQ(device.record("TaskingID"), Value("T1"));
  EXPECT_EQ(device.record("LastOSVersion"), Value("1.0 (A1)"));
  for (const char* user : {"mobile", "__quenset__", "guest"}) {
    EXPECT_TRUE(
        device.readPropertyList("var/preferences/" + std::string(user) + "/com.example.plist"))
        << user;
  }
  EXPECT_EQ(device.names("var/log/servita"), (Lines{"a.log.1", "a.log.2"}));
  const std::string events = device.root().read("var/spool/morvend/events.jsonl");
  EXPECT_EQ(std::count(events.begin(), events.end(), '\n'), 3);
  Lines keys, storageKeys;
  for (const std::string& row : device.recorded()) {
    const std::string key = row.substr(row.find(' ') + 1);
    (holds({key}, "NANDInfo") ? storageKeys : keys).push_back(key);
  }
  EXPECT_EQ(storageKeys.size(), 30u);
  for (const char* key :
       {"PagesPerVirtualBlock 1", "TotalPurgeableBytes 5000", "VMFreezer.NumPhysicalWrites 4096"}) {
    EXPECT_TRUE(holds(storageKeys, key)) << key;
  }
  const Lines recorded{"TLM_VMFreezer_bytesWritten 4096",
                       "com.norba.tarvenn.DiskUsageUserBlocksFree 3",
                       "com.norba.tarvenn.DiskUsageUserTotalBlocks 5",
                       "com.norba.velquist.channel 7", "datausage.wifiInKB.com.norba.process 2"};
  EXPECT_EQ(keys, recorded);
  EXPECT_TRUE(device.names("device/ecc-events").empty());
  // Yesterday's; three channels, the defects' header and one defect; the memory error.
  const Lines structured = device.structuredLogs();
  ASSERT_EQ(structured.size(), 7u);
  for (const std::size_t i : {1u, 2u, 3u, 4u, 5u}) {
    EXPECT_TRUE(structured[i].starts_with("{\"type\": 176, ")) << structured[i];
  }
  EXPECT_TRUE(structured[6].starts_with("{\"type\": 172, ")) << structured[6];
  EXPECT_TRUE(structured[6].ends_with("\"data\": {\"id\": 1, \"count\": 0}}")) << structured[6];

  const auto second = device.run("morvend", {"-d"});
  EXPECT_EQ(linesOf(second.standardError),
            (Lines{"morvend started", "Day unchanged since last run", "morvend ended"}));
  device.run("morvend", {"-f"});
  const auto logs = device.dailyLogs();
  ASSERT_EQ(logs.size(), 2u);
  EXPECT_EQ(*logs[1].find("PLTaskID"), Value("T1"));
  EXPECT_EQ(*logs[1].find("PLTaskDigest"), Value("D1"));
  EXPECT_EQ(logs[1].array("PLTasking")->size(), 3u);
  EXPECT_EQ(device.names(kSubmitted).size(), 5u)
      << "the same version carries no options, and the storage log is weekly";
}

TEST(DailyRun, EndsWithStatusZeroWithNothingAtAll) {
  Device empty, missing;
  std::filesystem::create_directory(empty.root() / "device");
  std::filesystem::remove(missing.root().path());
  for (const Device* device : {&empty, &missing}) {
    for (const char* option : {"-d", "-f", "-t", "-x"}) {
      const auto outcome = device->run("morvend", {option});
      EXPECT_EQ(outcome.status, 0) << outcome.standardError;
      EXPECT_TRUE(ended(outcome));
    }
  }
  EXPECT_FALSE(std::filesystem::exists(missing.root().path()));
  EXPECT_EQ(empty.record(kGateRecord), Value(empty.today() - 1));
  EXPECT_EQ(empty.recorded().size(), 2u) << "disk usage";
  EXPECT_TRUE(empty.history().empty());
}

// The exit status is the same for a day that left nothing: the last line, an error, is all that
// tells.
TEST(DailyRun, EndsWithWhatCouldNotBeKept) {
  const std::string preference = std::string("var/preferences/mobile/") + kDomain + ".plist";
  const struct {
    const char* option;
    std::string fileInTheWay, unkept;
    const char* why = "Not a directory";
  } rows[] = {{"-d", "elsewhere", ""},
              {"-x", "var", ""},
              {"-d", "var", preference + ": "},
              {"-f", "var/preferences/mobile", "var/preferences/mobile/com.example.plist: "},
              {"-d", "var/spool", "var/spool/morvend/submitted/log-pellorand.193."},
              {"-t", "var/mobile/Library/Pelloran", "var/mobile/Library/Pelloran: "},
              {"-d", preference, preference + ": ", "a file with several names"}};
  Device filled;
  filled.fill();
  for (const auto& row : rows) {
    Device device;
    device.become(filled);
    std::filesystem::remove_all(device.root() / row.fileInTheWay);
    device.root().write(row.fileInTheWay, "");
    if (row.fileInTheWay == preference) {
      std::filesystem::create_hard_link(device.root() / preference, device.root() / "other name");
    }
    const auto outcome = device.run("morvend", {row.option});
    EXPECT_EQ(outcome.status, 0);
    const std::string last = lastLine(outcome);
    if (row.unkept.empty()) {
      EXPECT_EQ(last, "<5>morvend ended") << row.fileInTheWay;
    } else {
      const std::string place = (device.root() / row.unkept).string();
      EXPECT_TRUE(last.starts_with("<3>the day is not done: " + place) &&
                  last.ends_with(std::string(": ") + row.why))
          << outcome.standardError;
    }
    if (row.unkept.starts_with(preference)) {
      EXPECT_TRUE(device.dailyLogs().empty());
      EXPECT_NE(outcome.standardError.find("Dropped what the run for day"), std::string::npos);
    }
  }
}

// Links that stay within the root: what they lead to is read, and left as it is.
TEST(DailyRun, WritesThroughNoLinkOfItsRoot) {
  const struct {
    std::string place, said;
    std::size_t logs;
  } rows[] = {
      {"var", "var/run/morvend.lock", 0},
      {"var/preferences", std::string("var/preferences/mobile/") + kDomain + ".plist", 0},
      {"var/spool", "var/spool/morvend/submitted", 0},
      {"var/spool/morvend/structured", "var/spool/morvend/structured", 1},
      {"var/log", "var/log/servita", 1},
      {"var/mobile", "var/mobile/Library/Pelloran", 1},
      {"device", "device/ecc-events", 1},
  };
  Device filled;
  filled.fill();
  for (const auto& row : rows) {
    Device device;
    device.become(filled);
    const auto place = device.root() / row.place, elsewhere = device.root() / "elsewhere";
    std::filesystem::rename(place, elsewhere);
    std::filesystem::create_symlink(std::filesystem::relative(elsewhere, place.parent_path()),
                                    place);
    const auto state = [&] {
      Lines files;
      for (const auto& entry : std::filesystem::recursive_directory_iterator(elsewhere)) {
        const std::string path = entry.path().lexically_relative(device.root().path());
        // The database library's own, of reading.
        if (path.ends_with("-wal") || path.ends_with("-shm")) continue;
        files.push_back(path + (entry.is_regular_file() ? ": " + device.root().read(path) : ""));
      }
      std::ranges::sort(files);
      return files;
    };
    const Lines before = state();
    const auto outcome = device.run("morvend", {"-d"});
    EXPECT_EQ(outcome.status, 0);
    EXPECT_TRUE(state() == before) << row.place;
    EXPECT_EQ(device.dailyLogs().size(), row.logs) << row.place << outcome.standardError;
    for (const std::string& line : linesOf(outcome.standardError)) {
      if (line.find("too many links") == line.npos) continue;
      EXPECT_NE(line.find(place.string()), line.npos) << line;
    }
    EXPECT_TRUE(holds(linesOf(outcome.standardError), (device.root() / row.said).string()))
        << row.place << outcome.standardError;
  }
}

// What the shell leaves a program: streams that are closed, a limit of file size.
TEST(DailyRun, TakesNoFileForAStreamAndNoLimitForItsEnd) {
  Device filled;
  filled.fill();
  const auto runAs = [](const Device& device, const std::string& how) {
    return faults::run({"/bin/sh", "-c", how, PROGRAMS "/morvend"}, device.environment(""));
  };
  for (const std::string closed : {"<&-", ">&-", "2>&-", "<&- 2>&-", "<&- >&- 2>&-"}) {
    Device device;
    device.become(filled);
    EXPECT_EQ(runAs(device, "exec \"$0\" -d " + closed).status, 0) << closed;
    EXPECT_EQ(device.dailyLogs().size(), 1u) << closed;
    for (const auto& entry : std::filesystem::recursive_directory_iterator(device.root().path())) {
      const std::string path = entry.path().lexically_relative(device.root().path());
      if (!entry.is_regular_file()) continue;
      EXPECT_EQ(device.root().read(path).find("morvend started"), std::string::npos)
          << closed << ": " << path;
    }
  }

  // A program built with a sanitizer may write a file of the sanitizer's before its own begins.
  if (!faults::available()) GTEST_SKIP() << "the rest is for programs without a sanitizer";
  Device device;
  device.become(filled);
  const auto outcome = runAs(device, "ulimit -f 0; exec \"$0\" -d");
  EXPECT_EQ(outcome.status, 0) << "signal " << outcome.signal;
  EXPECT_TRUE(lastLine(outcome).starts_with("<3>the day is not done: ") &&
              lastLine(outcome).ends_with("File too large"))
      << outcome.standardError;
  EXPECT_EQ(device.history(), filled.history());
}

// A timer's run beside another one: the second waits, and then finds the gate closed.
TEST(DailyRun, MakesOneLogWhenSeveralRunAtOnce) {
  Device device;
  device.fill();
  std::vector<faults::Outcome> outcomes(4);
  std::vector<std::thread> runs;
  for (auto& outcome : outcomes) {
    runs.emplace_back([&] { outcome = device.run("morvend", {"-d"}); });
  }
  for (auto& run : runs) run.join();
  int closed = 0;
  for (const auto& outcome : outcomes) {
    EXPECT_EQ(outcome.status, 0);
    closed += holds(linesOf(outcome.standardError), "Day unchanged since last run") ? 1 : 0;
  }
  EXPECT_EQ(closed, 3);
  ASSERT_EQ(device.dailyLogs().size(), 1u);
  EXPECT_FALSE(device.dailyLogs()[0].empty());
}

// Damage is set aside, counted, and told by the next report.
TEST(DailyRun, ReportsADamagedDatabaseTheNextDay) {
  Device device;
  device.fill();
  {
    std::fstream file(device.root() / support::kCountersDatabase);
    file.seekp(100);
    file << std::string(3000, '\xff');
  }
  const auto damaged = device.run("morvend", {"-f"});
  EXPECT_EQ(damaged.status, 0);
  EXPECT_TRUE(holds(linesOf(damaged.standardError), "set aside as PLDataStore.sqlitedb.corrupt"))
      << damaged.standardError;
  EXPECT_TRUE(std::filesystem::exists(device.root() /
                                      (std::string(support::kCountersDatabase) + ".corrupt")));
  EXPECT_TRUE(device.dailyLogs().empty());
  EXPECT_EQ(device.run("pelloran", {"set", "exact", "7", "--day", "yesterday"}).status, 0);
  device.run("morvend", {"-f"});
  device.run("morvend", {"-f"});
  const auto logs = device.dailyLogs();
  ASSERT_EQ(logs.size(), 2u);
  constexpr char kCount[] = "com.norba.quenset.prnd.database.corruptions";
  EXPECT_EQ(*logs[0].dictionary("PLScalars")->find(kCount), Value(3)) << "with those before";
  EXPECT_EQ(*logs[1].dictionary("PLScalars")->find(kCount), Value(0));
}

// A key that XML can't hold, from its record over the baseline, the history and the whitelist to
// the log: one day later the baseline knows it again.
TEST(DailyRun, KnowsAKeyAgainThatIsNotWrittenAsItCame) {
  Device device;
  device.fill();
  const std::string key = "datausage.wifiInKB.com.norba.p";
  const Dictionary record{{"procName", "p\x01"},
                          {"since", plist::Date{device.today() * 86400.0}},
                          {"wifiInBytes", 2048}};
  const Dictionary keys{{key + "\x01", Dictionary()}};
  using List = support::BinaryPropertyList;
  device.root().write("device/network-usage.plist",
                      List::of(Dictionary{{"Records", Array{record}}}));
  device.root().write(kWhitelist,
                      List::of(Dictionary{{"Group", Dictionary{{"ScalarKeys", keys}}}}));
  for (int run = 0; run < 3; ++run) device.run("morvend", {"-t"});
  const Dictionary reported{{key + "\xEF\xBF\xBD", 2}};
  ASSERT_EQ(device.dailyLogs().size(), 2u) << "the first run finds nothing to report";
  for (const Dictionary& log : device.dailyLogs()) {
    EXPECT_EQ(*log.dictionary("PLScalars"), reported);
  }
}

// A link in the place of a file or a folder that is written must lead nothing out of the root, and
// a FIFO must not stop the run.
// Root's run on another user's device leaves nothing there that this user can't write to, the
// database's files included, which a day and a counter make.
TEST(DailyRun, MakesEverythingTheOwnersOfTheFolders) {
  if (::geteuid() != 0) GTEST_SKIP() << "only root makes files for others";
  Device device;
  device.fill();
  std::filesystem::remove_all(device.root() / "var/mobile");
  constexpr uid_t kOwner = 4711;
  ASSERT_EQ(::lchown(device.root().path().c_str(), kOwner, kOwner), 0);
  const auto everything = [&device] {
    return std::filesystem::recursive_directory_iterator(device.root().path());
  };
  for (const auto& entry : everything()) {
    ASSERT_EQ(::lchown(entry.path().c_str(), kOwner, kOwner), 0);
  }
  EXPECT_EQ(device.run("pelloran", {"add", "exact", "1"}).status, 0);
  EXPECT_TRUE(ended(device.run("morvend", {"-d"})));
  for (const auto& entry : everything()) {
    struct stat status;
    ASSERT_EQ(::lstat(entry.path().c_str(), &status), 0);
    EXPECT_EQ(status.st_uid, kOwner) << entry.path();
    EXPECT_EQ(status.st_gid, kOwner) << entry.path();
  }
}

// A tasking of many settings costs what its size says: the calls are those of a small one.
TEST(DailyRun, WritesEachDomainOfATaskingOnce) {
  if (!faults::available()) GTEST_SKIP() << faults::kUnavailable;
  Device filled;
  filled.fill();
  const auto calls = [&filled](int settings) {
    Device device;
    device.become(filled);
    Array payload;
    for (int i = 0; i < settings; ++i) {
      const char* const users[] = {"mobile", "__quenset__", "guest"};
      payload.push_back(Dictionary{{"Domain", "com.example"},
                                   {"User", users[i % 3]},
                                   {"Key", std::to_string(i)},
                                   {"Value", i}});
    }
    device.writePropertyList(
        "var/preferences/__quenset__/com.norba.Varnhollow.plist",
        Dictionary{{"ScheduledTasking",
                    Dictionary{{"TaskingID", "T2"}, {"TaskingPayload", std::move(payload)}}}});
    return device.countCalls("morvend", {"-d"}, "EIO");
  };
  EXPECT_LE(calls(300), calls(3) + 3) << "and what more blocks of a file take";
}

TEST(DailyRun, TouchesNothingOutsideItsRoot) {
  const Lines written = linesOf(
      "var/run/morvend.lock\nvar/run\nvar/preferences/mobile\nvar/preferences/guest\n"
      "var/preferences/mobile/com.norba.pellorand.morvend.plist\n"
      "var/preferences/mobile/com.norba.quenset.morvend.plist\n"
      "var/preferences/guest/com.example.plist\nvar/spool\nvar/spool/morvend\n"
      "var/spool/morvend/events.jsonl\nvar/spool/morvend/submitted\n"
      "var/spool/morvend/structured\ndevice/ecc-events\nvar/log/servita/a.log\n"
      "var/log/servita/a.log.2\nvar/mobile/Library/Pelloran\n" +
      std::string(support::kCountersDatabase) + "\n" + support::kCountersDatabase + "-wal");
  Device filled;
  filled.fill();
  for (const std::string& path : written) {
    for (const std::string kind :
         {"link to a file", "link to a folder", "FIFO", "folder", "second name"}) {
      Device device;
      device.become(filled);
      const support::TemporaryFolder outside;
      outside.write("file", "untouched");
      outside.write("folder/file", "untouched");
      const auto place = device.root() / path;
      std::filesystem::remove_all(place);
      std::filesystem::create_directories(place.parent_path());
      if (kind == "link to a file") {
        std::filesystem::create_symlink(outside / "file", place);
      } else if (kind == "link to a folder") {
        std::filesystem::create_symlink(outside / "folder", place);
      } else if (kind == "second name") {
        std::filesystem::create_hard_link(outside / "file", place);
      } else if (kind == "FIFO") {
        ASSERT_EQ(::mkfifo(place.c_str(), 0600), 0);
      } else {
        std::filesystem::create_directory(place);
      }
      const auto outcome = device.run("morvend", {"-d"});
      EXPECT_EQ(outcome.status, 0) << path << " " << kind;
      EXPECT_TRUE(ended(outcome)) << path << " " << kind;
      EXPECT_EQ(outside.read("file"), "untouched") << path << " " << kind;
      EXPECT_EQ(std::filesystem::hard_link_count(outside / "file"), kind == "second name" ? 2u : 1u)
          << path;
      EXPECT_EQ(outside.read("folder/file"), "untouched") << path << " " << kind;
      const auto entries = [](const std::filesystem::path& folder) {
        return std::distance(std::filesystem::directory_iterator(folder), {});
      };
      EXPECT_EQ(entries(outside.path()), 2) << path << " " << kind;
      EXPECT_EQ(entries(outside / "folder"), 1) << path << " " << kind;
    }
  }
}

}  // namespace
}  // namespace end_to_end
