// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/outbox/StructuredLogFiles.h"

#include <cstdint>
#include <filesystem>
#include <utility>

#include <gtest/gtest.h>

#include "HostServices.h"

namespace host {
namespace {

constexpr char kStructured[] = "var/spool/morvend/structured/";
constexpr char kSubmitted[] = "var/spool/morvend/submitted/";

struct StructuredLogFilesTest : testing::Test, support::HostServices {
  PendingRun run;
  StructuredLogFiles logs{root, clock, log, run};

  std::string structured(const std::string& name) const { return folder.read(kStructured + name); }
  std::string submitted(const std::string& name) const { return folder.read(kSubmitted + name); }
};

TEST_F(StructuredLogFilesTest, ALineIsAppendedToTheFileOfItsDay) {
  logs.logStructuredData(176, {{"wear", 3}, {"rate", 1.0}});
  logs.logStructuredData(-1, {});
  EXPECT_EQ(structured("2026-11-22.jsonl"),
            "{\"type\": 176, \"time\": \"2026-11-22T04:00:00Z\", \"data\": {\"wear\": 3, "
            "\"rate\": 1.0}}\n"
            "{\"type\": -1, \"time\": \"2026-11-22T04:00:00Z\", \"data\": {}}\n");
  const std::pair<double, const char*> days[] = {{-1e300, "0000-01-01"}, {1e300, "9999-12-31"}};
  for (const auto& [seconds, day] : days) {
    clock.seconds = seconds;
    logs.logStructuredData(1, {});
    EXPECT_NE(structured(std::string(day) + ".jsonl"), "");
  }
}

TEST_F(StructuredLogFilesTest, EarlierDaysGoToTheSpoolAndNothingElseDoes) {
  const char* earlier[] = {"0000-01-01.jsonl", "2026-11-20.jsonl", "2026-11-21.jsonl"};
  const char* others[] = {"2026-11-22.jsonl", "2026-11-23.jsonl", "2026-1-1.jsonl", "x.jsonl",
                          "2026-11-20.json",  "-026-11-20.jsonl", ".jsonl"};
  for (const char* name : earlier) folder.write(kStructured + std::string(name), name);
  for (const char* name : others) folder.write(kStructured + std::string(name), name);
  folder.write(kSubmitted + std::string("structured-2026-11-20.jsonl"), "taken");
  std::filesystem::create_directory(folder.path() / kSubmitted / "structured-2026-11-20-2.jsonl");
  logs.dumpAllOldStructuredDataLogs();
  EXPECT_EQ(submitted("structured-0000-01-01.jsonl"), earlier[0]);
  EXPECT_EQ(submitted("structured-2026-11-20.jsonl"), "taken");
  EXPECT_EQ(submitted("structured-2026-11-20-3.jsonl"), earlier[1]);
  EXPECT_EQ(submitted("structured-2026-11-21.jsonl"), earlier[2]);
  for (const char* name : earlier) EXPECT_EQ(structured(name), "");
  for (const char* name : others) EXPECT_EQ(structured(name), name);
  EXPECT_TRUE(log.lines().empty());
}

TEST_F(StructuredLogFilesTest, WhatCannotBeWrittenIsSaidOnceForEachReason) {
  const std::string today = kStructured + std::string("2026-11-22.jsonl");
  folder.write("other", "other\n");
  std::filesystem::create_directories(folder / kStructured);
  std::filesystem::create_hard_link(folder / "other", folder / today);
  for (const char* why : {"a file with several names", "not a regular file"}) {
    for (int n = 0; n < 3; ++n) logs.logStructuredData(1, {});
    EXPECT_EQ(log.count("error: Could not write " + root.hostPath(today) + ": " + why), 1);
    std::filesystem::remove(folder / today);
    std::filesystem::create_directory(folder / today);
  }
  EXPECT_EQ(log.lines().size(), 2u);
  EXPECT_EQ(folder.read("other"), "other\n");
}

TEST_F(StructuredLogFilesTest, WhatIsNoFileStaysAndWhatIsTooLargeIsCut) {
  const auto at = folder.path() / kStructured / "2026-11-20.jsonl", target = folder / "target";
  for (const support::Kind kind : support::kOtherKinds) {
    support::put(kind, at, target);
    logs.dumpAllOldStructuredDataLogs();
    EXPECT_EQ(log.count("error: Could not move " + at.string()), 1);
    EXPECT_TRUE(support::untouched(kind, at, target));
    std::filesystem::remove(at);
    std::filesystem::remove(target);
    log.clear();
  }
  // Lines of which one is in the way of every cut, the second longer than a part.
  const std::string lines = std::string((15 << 20), 'a') + '\n' + std::string((18 << 20), 'b') +
                            '\n' + std::string((9 << 20), 'c') + '\n' + std::string(99, 'd');
  folder.write(kSubmitted + std::string("kept"), "kept");
  folder.write(kStructured + std::string("2026-11-20.jsonl"), lines);
  std::filesystem::create_hard_link(at, target);
  logs.dumpAllOldStructuredDataLogs();
  EXPECT_EQ(log.count("several names"), 1);
  std::filesystem::remove(target);
  log.clear();
  logs.dumpAllOldStructuredDataLogs();
  std::string whole;
  for (const char* part : {"", "-2", "-3", "-4"}) {
    const std::string text = submitted("structured-2026-11-20" + std::string(part) + ".jsonl");
    EXPECT_LE(text.size(), std::size_t{16} << 20);
    whole += text;
  }
  EXPECT_TRUE(whole == lines);
  EXPECT_EQ(log.count("default: " + at.string() + " has"), 1);
  EXPECT_EQ(log.lines().size(), 1u);
  EXPECT_EQ(submitted("kept"), "kept");
  // More than the spool holds: its newest end, beside the logs that are there.
  std::filesystem::remove_all(folder / kSubmitted);
  folder.write(kSubmitted + std::string("kept"), "kept");
  folder.write(kStructured + std::string("2026-11-19.jsonl"), "");
  std::filesystem::resize_file(folder / kStructured / "2026-11-19.jsonl", std::uintmax_t{1} << 36);
  folder.write(kStructured + std::string("2026-11-20.jsonl"), lines);
  logs.dumpAllOldStructuredDataLogs();
  EXPECT_EQ(submitted("structured-2026-11-19.jsonl").size(),
            (std::size_t{48} << 20) - lines.size());
  EXPECT_EQ(log.count("2026-11-19.jsonl has 68719476736 bytes: the first 6871318"), 1);
  EXPECT_EQ(submitted("kept"), "kept");
}

}  // namespace
}  // namespace host
