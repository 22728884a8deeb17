// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/outbox/SubmissionSpool.h"

#include <fcntl.h>
#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <set>
#include <utility>

#include "HostServices.h"
#include "host/outbox/SpoolFolder.h"
#include "host/preferences/PreferenceFiles.h"
#include "platform/LogSubmission.h"

namespace host {
namespace {

constexpr char kLog[] = "log-pellorand.193.20261122T040000Z";

struct SubmissionSpoolTest : testing::Test, support::HostServices {
  PreferenceFiles preferences{root, log};
  PendingRun run;
  SubmissionSpool spool{root, preferences, clock, log, run};

  bool submit(const std::string& bytes = "bytes", const plist::Dictionary* options = nullptr,
              const std::string& type = "193", const std::string& name = "log-pellorand") {
    return spool.QNSWriteLogForSubmission(type, name, options,
                                          [&](platform::LogHandle& file) { file.write(bytes); });
  }
  std::filesystem::path inSpool(const std::string& name) const {
    return folder.path() / (SpoolFolder::kPath + 1) / name;
  }
  std::string read(const std::string& name) const {
    return folder.read(std::string(SpoolFolder::kPath + 1) + "/" + name);
  }
  std::set<std::string> names() const {
    std::set<std::string> all;
    for (const auto& entry : std::filesystem::directory_iterator(inSpool(""))) {
      all.insert(entry.path().filename());
    }
    return all;
  }
  // A log of some size, the n-th oldest.
  void old(const std::string& name, std::uintmax_t size, int n) const {
    std::filesystem::create_directories(inSpool(""));
    std::ofstream(inSpool(name)).flush();
    std::filesystem::resize_file(inSpool(name), size);
    const timespec time[2] = {{1000 + n, 0}, {1000 + n, 0}};
    ::utimensat(AT_FDCWD, inSpool(name).c_str(), time, 0);
  }
};

TEST_F(SubmissionSpoolTest, LogsOfOneSecondAreNumberedAndKeepTheirOptions) {
  const plist::Dictionary options{{"previous_os_version", "1.0"}};
  EXPECT_TRUE(submit("one"));
  EXPECT_TRUE(submit("two", &options));
  EXPECT_TRUE(submit("three"));
  const std::string log2 = std::string(kLog) + "-2", log3 = std::string(kLog) + "-3";
  EXPECT_EQ(names(), (std::set<std::string>{kLog, log2, log2 + ".options.plist", log3}));
  EXPECT_EQ(read(kLog) + read(log2) + read(log3), "onetwothree");
  EXPECT_EQ(read(log2 + ".options.plist"), xml(options));
  using std::filesystem::perms;
  EXPECT_EQ(std::filesystem::status(inSpool(kLog)).permissions(),
            perms::owner_read | perms::owner_write);
  EXPECT_EQ(std::filesystem::status(inSpool("")).permissions(), perms::owner_all);
}

TEST_F(SubmissionSpoolTest, ANameIsTakenByWhateverItIs) {
  const auto target = folder / "target";
  for (const support::Kind kind : support::kOtherKinds) {
    for (const char* suffix : {"", ".options.plist"}) {
      const auto at = inSpool(kLog + std::string(suffix));
      support::put(kind, at, target);
      EXPECT_TRUE(submit());
      EXPECT_EQ(read(std::string(kLog) + "-2"), "bytes");
      EXPECT_TRUE(support::untouched(kind, at, target));
      std::filesystem::remove_all(folder / "var");
      std::filesystem::remove(target);
    }
  }
}

TEST_F(SubmissionSpoolTest, WhatAKilledRunLeftIsRemoved) {
  for (const char* name : {".log.new", ".options.new", "orphan.options.plist"}) old(name, 3, 0);
  old("foreign", 3, 0);
  EXPECT_TRUE(submit());
  EXPECT_EQ(names(), (std::set<std::string>{"foreign", kLog}));
}

TEST_F(SubmissionSpoolTest, TheOldestLogsGoWithTheirOptionsAndALineEach) {
  for (int n = 0; n < 1001; ++n) old("old-" + std::to_string(n), 1, n < 500 ? 0 : n);
  old("old-0.options.plist", 1, 0);
  old("old-1.options.plist", 1, 0);
  EXPECT_TRUE(submit());
  const auto left = names();
  EXPECT_EQ(left.size(), 1000u);
  for (const char* gone : {"old-0", "old-0.options.plist", "old-1", "old-1.options.plist"}) {
    EXPECT_FALSE(left.contains(gone)) << gone;
  }
  EXPECT_TRUE(left.contains("old-2") && left.contains(kLog));
  EXPECT_EQ(log.count("default: Removed " + root.hostPath("var/spool/morvend/submitted/old-")), 2);
}

TEST_F(SubmissionSpoolTest, TheBytesAreBounded) {
  constexpr std::uintmax_t kMiB = 1 << 20;
  old("older", 30 * kMiB, 0);
  old("newer", 30 * kMiB, 1);
  old("newer.options.plist", 4 * kMiB - 5, 1);
  old("huge", std::uintmax_t{1} << 40, 2);
  EXPECT_TRUE(submit());
  EXPECT_EQ(names(), (std::set<std::string>{kLog}));
  log.clear();
  EXPECT_FALSE(submit(std::string(64 * kMiB + 1, 'x')));
  EXPECT_EQ(names(), (std::set<std::string>{kLog}));
  EXPECT_EQ(log.count("error: Could not submit " +
                      root.hostPath("var/spool/morvend/submitted/log-pellorand.193.")),
            1);
  old("exact", 64 * kMiB - 10, 0);
  EXPECT_TRUE(submit());
  EXPECT_TRUE(names().contains("exact"));
  EXPECT_TRUE(submit("x"));
  EXPECT_FALSE(names().contains("exact"));
}

TEST_F(SubmissionSpoolTest, NoLinkIsFollowedToTheFolder) {
  std::filesystem::create_directories(folder / "elsewhere");
  std::filesystem::create_directories(folder / "var/spool");
  std::filesystem::create_symlink(folder / "elsewhere", folder / "var/spool/morvend");
  EXPECT_FALSE(submit());
  EXPECT_TRUE(std::filesystem::is_empty(folder / "elsewhere"));
  EXPECT_EQ(log.count("error: "), 1);
}

TEST_F(SubmissionSpoolTest, WhatStandsWhereALogIsWrittenIsMovedOutOfTheWay) {
  const plist::Dictionary options{{"previous_os_version", "1.0"}};
  for (const char* name : {SpoolFolder::kUnfinishedLog, SpoolFolder::kUnfinishedOptions}) {
    for (int times = 0; times < 2; ++times) {
      folder.write(std::string(SpoolFolder::kPath + 1) + "/" + name + "/kept", "theirs");
      EXPECT_TRUE(submit("bytes", &options));
    }
    const std::string aside = std::string(name) + ".in-the-way";
    EXPECT_EQ(read(aside + "/kept") + read(aside + "-2/kept"), "theirstheirs");
  }
  EXPECT_TRUE(log.lines().empty());
}

TEST_F(SubmissionSpoolTest, NamesThatAreNoFileNamesAreRefused) {
  for (const std::string& bad :
       {std::string(), std::string("../x"), std::string("a\0b", 3), std::string(250, 'x')}) {
    EXPECT_FALSE(submit("bytes", nullptr, bad));
    EXPECT_FALSE(submit("bytes", nullptr, "193", bad));
  }
  EXPECT_FALSE(submit("bytes", nullptr, "193", ".hidden"));
  EXPECT_EQ(log.count("not a file name"), 9);
  EXPECT_FALSE(std::filesystem::exists(folder / "var"));
}

TEST_F(SubmissionSpoolTest, ConsentIsTheUsersAndOffByDefault) {
  EXPECT_FALSE(spool.DiagnosticLogSubmissionEnabled());
  folder.write("var/preferences/mobile/com.norba.quenset.plist",
               xml({{"DiagnosticLogSubmissionEnabled", true}}));
  EXPECT_TRUE(spool.DiagnosticLogSubmissionEnabled());
  const std::pair<plist::Value, bool> rows[] = {{1, true},    {1.0, false}, {2, false},
                                                {-1, false},  {0, false},   {"true", false},
                                                {1.5, false}, {0.1, false}, {false, false}};
  for (const auto& [consent, given] : rows) {
    folder.write("var/preferences/mobile/com.norba.quenset.plist",
                 xml({{"DiagnosticLogSubmissionEnabled", consent}}));
    EXPECT_EQ(spool.DiagnosticLogSubmissionEnabled(), given) << description(consent);
  }
}

}  // namespace
}  // namespace host
