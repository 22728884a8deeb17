// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include <gtest/gtest.h>
#include <sys/wait.h>

#include <cmath>
#include <filesystem>
#include <fstream>
#include <limits>
#include <optional>

#include "counter_store_support.h"
#include "platform/PLHistory.h"

namespace {

using host::CounterChange;
using support::StoreFixture;
using Lines = std::vector<std::string>;
using std::filesystem::perms;

constexpr std::int64_t kMax = std::numeric_limits<std::int64_t>::max();
constexpr std::int64_t kLeast = std::numeric_limits<std::int64_t>::min();

class CounterStoreRows : public testing::Test {
 protected:
  void sql(const char* text) { support::sql(folder / support::kDatabase, text); }

  support::TemporaryFolder folder;
  StoreFixture here{folder.path()};
};

TEST_F(CounterStoreRows, SumsSaturateInsteadOfWrapping) {
  struct {
    std::int64_t start, added, sum;
  } const cases[] = {
      {1, 2, 3},          {kMax, 1, kMax},      {kMax - 1, 1, kMax}, {kLeast, -1, kLeast},
      {kMax, kLeast, -1}, {-1, kLeast, kLeast}, {kLeast, kMax, -1},  {5, -7, -2}};
  for (const auto& row : cases) {
    EXPECT_TRUE(here.store.set("k", row.start, 1));
    EXPECT_TRUE(here.store.add("k", row.added, 1));
    EXPECT_EQ(here.rows(), Lines{"1 k " + std::to_string(row.sum)});
  }
}

TEST_F(CounterStoreRows, ClientsRecordForTodayAndAFailureIsSaidOnce) {
  here.store.PLClientAddValueForScalarKey("added", 5);
  here.store.PLClientAddValueForScalarKey("added", -7);
  here.store.PLClientSetValueForScalarKey("set", 5);
  here.store.PLClientSetValueForScalarKey("set", INT64_MIN);
  here.clock.seconds = here.clock.seconds + 86400;
  here.store.PLClientAddValueForScalarKey("added", 1);
  EXPECT_EQ(here.rows(),
            (Lines{"20779 added -2", "20779 set -9223372036854775808", "20780 added 1"}));
  EXPECT_TRUE(here.log.lines().empty());
  std::filesystem::remove_all(folder / "var");
  std::ofstream(folder / "var");
  StoreFixture blocked(folder.path());
  for (int i = 0; i < 3; ++i) blocked.store.PLClientSetValueForScalarKey("set", i);
  EXPECT_EQ(
      blocked.log.count("error: Could not record counters: " + (folder / "var/mobile").string()),
      1);
  EXPECT_EQ(blocked.log.lines().size(), 1u);
}

TEST_F(CounterStoreRows, RowsComeByDayThenBytesOfTheKeyWithinTheBounds) {
  for (const std::string_view key : {"b", "\xC3\xA4", "B", "a", ""})
    EXPECT_TRUE(here.store.set(key, 1, -3));
  EXPECT_TRUE(here.store.set("ab", 2, -3));
  EXPECT_TRUE(here.store.set("a", 3, INT32_MAX));
  EXPECT_TRUE(here.store.set("a", 4, INT32_MIN));
  EXPECT_EQ(here.rows(), (Lines{"-2147483648 a 4", "-3  1", "-3 B 1", "-3 a 1", "-3 ab 2", "-3 b 1",
                                "-3 \xC3\xA4 1", "2147483647 a 3"}));
  const auto history = here.store.initWithDefaultPath();
  EXPECT_EQ(support::rows(*history, here.log, "a", -3, 5), (Lines{"-3 a 1", "-3 ab 2"}));
  EXPECT_EQ(support::rows(*history, here.log, "", -2, -3), Lines{});
  EXPECT_EQ(support::rows(*history, here.log, "", -4, -3).size(), 6u);
}

TEST_F(CounterStoreRows, SamplesKeepTheirOrderAcrossCheckpointsAndBlocks) {
  std::string expected = "7 k";
  std::vector<CounterChange> changes;
  for (int i = 0; i < 3000; ++i) {
    expected += base::format(" %d:%d.5", i % 86400, 5000 - i);
    changes.push_back({.kind = CounterChange::Kind::push,
                       .key = "k",
                       .day = 7,
                       .sample = 5000.5 - i,
                       .seconds = i % 86400});
    if (i % 700 == 699 || i == 2999) {
      EXPECT_TRUE(here.store.apply(changes));
      EXPECT_TRUE(here.store.push("j", i, 7, 1));
      changes.clear();
      if (i < 2900) here.store.PLClientCheckpoint();
    }
  }
  EXPECT_TRUE(here.store.push("z", std::numeric_limits<double>::infinity(), 6, 2));
  EXPECT_EQ(here.rows(), (Lines{"6 z 2:inf", "7 j 1:699 1:1399 1:2099 1:2799 1:2999", expected}));
  EXPECT_EQ(here.log.lines(), Lines{});
}

TEST_F(CounterStoreRows, ASkippedSeriesNeitherLosesNorMixesTheNextAndStopEndsTheRows) {
  for (int i = 0; i < 600; ++i) EXPECT_TRUE(here.store.push(i % 2 == 0 ? "a" : "b", i, 1, 0));
  here.store.PLClientCheckpoint();
  EXPECT_TRUE(here.store.push("a", 600, 1, 0));
  EXPECT_TRUE(here.store.push("c", 1, 1, 0));
  Lines seen;
  EXPECT_TRUE(here.store.history()->distributionsForKeyPrefix(
      "", 0, 9,
      [&](std::string_view key, std::int32_t, platform::PLHistoryDistributionEnumerator& samples,
          bool& stop) {
        // A handler may query, and write to the store.
        if (key == "b") {
          EXPECT_EQ(here.rows().size(), 3u);
          seen.push_back("b" + base::doubleText(samples.getNextValues()->values.front()));
          EXPECT_TRUE(here.store.push("c", 2, 1, 0));
        } else {
          seen.emplace_back(key);
        }
        stop = key == "b";
      }));
  EXPECT_EQ(seen, (Lines{"a", "b1"}));
  EXPECT_EQ(here.rows().back(), "1 c 0:1 0:2");
}

TEST_F(CounterStoreRows, ASeriesTellsOnTheLastDayButOneWhetherItComesAgain) {
  const struct {
    std::int32_t day;
    const char* keys;
  } days[] = {{0, "c"}, {5, "abcd"}, {6, "bde"}};
  for (const auto& [day, keys] : days) {
    for (const char* key = keys; *key != '\0'; ++key)
      EXPECT_TRUE(here.store.push({key, 1}, 1, day, 0));
  }
  here.store.PLClientCheckpoint();
  const auto again = [&](std::int32_t first, std::int32_t last) {
    std::string seen;
    EXPECT_TRUE(here.store.history()->distributionsForKeyPrefix(
        "", first, last,
        [&](std::string_view key, std::int32_t, platform::PLHistoryDistributionEnumerator& samples,
            bool&) { seen.append(key).append(samples.comesAgain() ? "+" : ""); }));
    return seen;
  };
  EXPECT_EQ(again(5, 6), "ab+cd+bde");
  EXPECT_EQ(again(6, 6), "bde");
  EXPECT_EQ(again(0, 5), "cabcd");
}

TEST_F(CounterStoreRows, ACheckpointKeepsTheNewestSixtyDaysThatHoldRowsOfAnyKind) {
  for (int i = 0; i < 70; ++i) {
    const std::int32_t day = i * 500 - 14500;
    EXPECT_TRUE(i % 2 == 0 ? here.store.set("k", i, day) : here.store.push("k", i, day, 0));
  }
  // Days to come neither count nor go.
  for (std::int32_t i = 1; i <= 70; ++i) EXPECT_TRUE(here.store.set("k", i, 20779 + i));
  here.store.PLClientCheckpoint();
  const auto lines = here.rows();
  ASSERT_EQ(lines.size(), 130u);
  EXPECT_EQ(lines.front(), "-9500 k 10");
  EXPECT_EQ(std::filesystem::file_size(folder / (std::string(support::kDatabase) + "-wal")), 0u);
}

TEST_F(CounterStoreRows, ReadsAndCheckpointsOfNothingCreateNothing) {
  for (const auto& home : {std::optional<std::string>(), std::optional<std::string>("/nowhere"),
                           std::optional<std::string>("/var/mobile")}) {
    here.home = home;
    EXPECT_EQ(here.rows(), Lines{});
    EXPECT_EQ(here.log.count("error: there is no home folder"), home ? 0 : 1);
    here.store.PLClientCheckpoint();
    here.log.clear();
  }
  EXPECT_TRUE(std::filesystem::is_empty(folder.path()));
  here.home.reset();
  EXPECT_FALSE(here.store.set("k", 1, 1));
}

TEST_F(CounterStoreRows, FilesAreForTheirOwnerOnly) {
  EXPECT_TRUE(here.store.set("k", 1, 1));
  for (const char* suffix : {"", "-wal", "-shm"}) {
    const auto file = folder / (std::string(support::kDatabase) + suffix);
    EXPECT_EQ(std::filesystem::status(file).permissions(), perms{0600}) << suffix;
    EXPECT_EQ(std::filesystem::status(file.parent_path()).permissions(), perms{0700});
  }
}

TEST_F(CounterStoreRows, AChangeThatCannotBeRecordedTakesTheOthersWithIt) {
  const CounterChange changes[] = {
      {.kind = CounterChange::Kind::set, .key = "k", .day = 1, .amount = 1},
      {.kind = CounterChange::Kind::push, .key = "k", .day = 1, .sample = NAN}};
  EXPECT_FALSE(here.store.apply(changes));
  EXPECT_EQ(here.rows(), Lines{});
}

TEST_F(CounterStoreRows, AnythingButARegularFileInAPlaceOfTheDatabaseIsRefused) {
  for (const char* suffix : {"", "-wal", "-shm", "-journal"}) {
    for (const support::Kind kind : support::kOtherKinds) {
      const support::TemporaryFolder device, outside;
      const auto path = device / (std::string(support::kDatabase) + suffix);
      StoreFixture there(device.path());
      if (*suffix != '\0') {
        EXPECT_TRUE(there.store.set("k", 1, 1));
      }
      std::filesystem::remove(path);
      support::put(kind, path, outside / "target");
      StoreFixture fresh(device.path());
      EXPECT_NE(fresh.store.set("k", 1, 1).error().text.find("not a regular file"),
                std::string::npos)
          << path;
      EXPECT_EQ(fresh.rows(), Lines{}) << path;
      EXPECT_EQ(fresh.log.lines().size(), 1u) << path;
      EXPECT_EQ(fresh.damaged, 0);
      EXPECT_TRUE(support::untouched(kind, path, outside / "target")) << path;
    }
  }
}

// A reader follows links that stay below the root; nobody writes through one, or to a file that
// has another name.
TEST_F(CounterStoreRows, WhatIsNotTheStoresOwnIsReadAndLeftAsItIs) {
  const std::string folderPath = "var/mobile/Library/Pelloran", database = support::kDatabase;
  const struct {
    std::string from, to;
    const char* target;  // of the link; null: a second name
    const char* refusal;
  } rows[] = {{"var/mobile", "m2", "../m2", "none is followed"},
              {folderPath, "elsewhere", "/elsewhere", "none is followed"},
              {database, "db", "/db", "not a regular file"},
              {database, "db", nullptr, "several names"},
              {database + "-wal", "wal", nullptr, "several names"}};
  for (const auto& row : rows) {
    for (const bool damaged : {false, true}) {
      SCOPED_TRACE(row.from + (damaged ? " damaged" : ""));
      const support::TemporaryFolder device;
      const bool log = row.from.ends_with("-wal");
      {
        StoreFixture original(device.path());
        EXPECT_TRUE(original.store.set("k", 1, 1));
        EXPECT_TRUE(original.store.settle());
        if (row.to != "db" && !log) {  // in the write-ahead log
          EXPECT_TRUE(original.store.set("k", 2, 1));
        }
      }
      if (damaged) device.write(support::kDatabase, std::string(5000, 'x'));
      if (log) device.write(row.from, "");
      if (row.target == nullptr) {
        std::filesystem::create_hard_link(device / row.from, device / row.to);
      } else {
        std::filesystem::rename(device / row.from, device / row.to);
        std::filesystem::create_symlink(row.target, device / row.from);
      }
      const std::string before = device.read(support::kDatabase);
      StoreFixture linked(device.path());
      EXPECT_NE(linked.store.set("k", 9, 1).error().text.find(row.refusal), std::string::npos);
      EXPECT_EQ(device.read(support::kDatabase), before);
      const char* value = row.to == "db" || log ? "1 k 1" : "1 k 2";
      EXPECT_EQ(linked.rows(), damaged ? Lines{} : Lines{value});
      EXPECT_EQ(linked.log.lines().size(), damaged ? 1u : 0u);
      EXPECT_EQ(linked.damaged, damaged && row.target == nullptr ? 1 : 0);
    }
  }
  std::filesystem::create_directory_symlink("/nowhere", folder / "var");
  EXPECT_EQ(here.rows(), Lines{});
  EXPECT_EQ(here.log.count("leads nowhere"), 1);
}

TEST_F(CounterStoreRows, RowsOfWrongTypesAndHalfRecordsAreSkipped) {
  EXPECT_TRUE(here.store.set("k", 1, 1));
  EXPECT_TRUE(here.store.push("k", 2.5, 1, 3));
  here.store.PLClientCheckpoint();
  sql("UPDATE packed SET samples = CAST(samples || x'0102030405' AS BLOB)");
  sql("INSERT INTO packed VALUES(1, 'l', x''), (1, 'm', x'00'), (99999999999, 'n', x'')");
  sql("INSERT INTO scalars VALUES(99999999999, 'far', 1)");
  EXPECT_EQ(here.rows(), (Lines{"1 k 1", "1 k 3:2.5", "1 l", "1 m"}));
}

// What the store writes is one row; what somebody else has written is told as it is written.
TEST_F(CounterStoreRows, KeysThatBecomeTheSameWhenTheyAreWrittenAreOne) {
  const std::string key = "a\xEF\xBF\xBD";
  for (const char* added : {"a\x01", "a\x1F", "a\xFF", "a\xEF\xBF\xBE"}) {
    EXPECT_TRUE(here.store.add(added, 1, 1));
    EXPECT_TRUE(here.store.push(added, 2, 1, 3));
  }
  EXPECT_EQ(here.rows(), (Lines{"1 " + key + " 4", "1 " + key + " 3:2 3:2 3:2 3:2"}));
  here.store.PLClientCheckpoint();
  sql("DELETE FROM scalars; INSERT INTO scalars VALUES(1, 'a' || char(1), 5), (1, 'ab', 6),"
      "(1, 'a' || CAST(x'FF' AS TEXT), 7);"
      "UPDATE packed SET key = 'a' || char(1);"
      "INSERT INTO staged VALUES(1, 'a' || char(1), 4, 1.5), (1, 'a' || char(2), 4, 0.5)");
  const Lines lines{"1 " + key + " 5", "1 ab 6", "1 " + key + " 7",
                    "1 " + key + " 3:2 3:2 3:2 3:2 4:1.5", "1 " + key + " 4:0.5"};
  EXPECT_EQ(here.rows(), lines);
  here.store.PLClientCheckpoint();
  EXPECT_EQ(here.rows(), lines);
  EXPECT_EQ(support::rows(*here.store.history(), here.log, "a\x03").size(), 4u)
      << "as the keys are written";
}

TEST_F(CounterStoreRows, ANewerDatabaseIsRefusedAndLeftAlone) {
  EXPECT_TRUE(here.store.set("k", 1, 1));
  sql("PRAGMA user_version = 2");
  StoreFixture fresh(folder.path());
  EXPECT_NE(fresh.store.set("k", 2, 1).error().text.find("newer version"), std::string::npos);
  EXPECT_EQ(fresh.rows(), Lines{});
  EXPECT_EQ(fresh.log.count("newer version"), 1);
  EXPECT_EQ(fresh.damaged, 0);
}

TEST_F(CounterStoreRows, TablesThatAreNotTheStoresAreSetAside) {
  for (const char* change : {"DROP TABLE staged", "ALTER TABLE staged ADD COLUMN x TEXT",
                             "CREATE TABLE kept(name)", "CREATE VIEW waiting_recorded AS SELECT 1",
                             "PRAGMA user_version = -1", "PRAGMA user_version = 0"}) {
    EXPECT_TRUE(here.store.set("k", 1, 1));
    sql(change);
    StoreFixture fresh(folder.path());
    EXPECT_TRUE(fresh.store.add("k", 5, 1)) << change;
    EXPECT_EQ(fresh.rows(), Lines{"1 k 5"}) << change;
    EXPECT_EQ(fresh.damaged, 1) << change;
    // The other store notices that the file is another.
    EXPECT_TRUE(here.store.add("k", 1, 1));
    EXPECT_EQ(here.rows(), Lines{"1 k 6"}) << change;
    EXPECT_EQ(here.damaged, 0);
  }
}

// None of it is taken for damage, and none has a say in what is written.
TEST_F(CounterStoreRows, WhatSomebodyAddedToTheDatabaseIsLeftAloneAndNeverRun) {
  const struct {
    const char* sql;
    bool left;
  } rows[] = {
      {"CREATE INDEX a ON scalars(key, day DESC)", true},
      {"CREATE INDEX \"b c\" ON staged (\"key\",value)", true},
      {"ANALYZE", true},
      {"CREATE VIEW v AS SELECT * FROM scalars", true},
      {"CREATE TABLE t(k REFERENCES scalars(key) ON DELETE CASCADE)", true},
      {"CREATE TRIGGER t AFTER INSERT ON scalars BEGIN DELETE FROM scalars; END", true},
      {"CREATE TRIGGER scalars BEFORE INSERT ON staged BEGIN SELECT RAISE(FAIL, 'no'); END", true},
      {"CREATE UNIQUE INDEX u ON scalars(value)", false},
      {"CREATE INDEX \"q\"\"(x)\" ON staged(lower(key))", false},
      {"CREATE INDEX o ON scalars(day % value)", false},
      {"CREATE INDEX p ON scalars(day) WHERE abs(value) > 1", false},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.sql);
    const support::TemporaryFolder device;
    EXPECT_TRUE(StoreFixture(device.path()).store.set("k", 5, 1));
    support::sql(device / support::kDatabase, row.sql);
    const auto schema = [&] {
      return support::sql(device / support::kDatabase,
                          "SELECT group_concat(name || coalesce(sql, '')) FROM sqlite_schema");
    };
    const std::string before = schema();
    StoreFixture fresh(device.path());
    EXPECT_EQ(fresh.rows(), Lines{"1 k 5"});
    EXPECT_EQ(schema(), before);
    EXPECT_TRUE(fresh.store.set("l", 5, 1));
    for (int i = 0; i < 2; ++i) EXPECT_TRUE(fresh.store.push("no json", 2, 1, 3));
    fresh.store.PLClientCheckpoint();
    EXPECT_EQ(fresh.rows(), (Lines{"1 k 5", "1 l 5", "1 no json 3:2 3:2"}));
    EXPECT_EQ(schema() == before, row.left);
    EXPECT_EQ(fresh.log.count("has a say in what is written, is dropped"), row.left ? 0 : 1);
    EXPECT_EQ(fresh.damaged, 0);
  }
}

// As another user where the tests run as root, whom no mode stops.
TEST_F(CounterStoreRows, ADeviceThatCannotBeWrittenIsStillRead) {
  const auto allow = [this](perms ofFolders, perms ofFiles) {
    std::filesystem::permissions(folder.path(), ofFolders);
    for (const auto& entry : std::filesystem::recursive_directory_iterator(folder.path())) {
      std::filesystem::permissions(entry.path(), entry.is_directory() ? ofFolders : ofFiles);
    }
  };
  for (const Lines& gone : {Lines{"-wal", "-shm"}, Lines{"-shm"}, Lines{}}) {
    EXPECT_TRUE(here.store.set("k", 1, 1));
    here.store.PLClientCheckpoint();
    for (const std::string& suffix : gone) {
      std::filesystem::remove(folder / (support::kDatabase + suffix));
    }
    allow(perms{0555}, perms{0444});
    const pid_t child = ::fork();
    if (child == 0) {
      if (::geteuid() == 0 && ::setresuid(65534, 65534, 65534) != 0) ::_exit(9);
      StoreFixture reader(folder.path());
      if (reader.rows() != Lines{"1 k 1"}) ::_exit(1);
      if (reader.store.set("k", 2, 1)) ::_exit(2);
      ::_exit(reader.damaged == 0 ? 0 : 3);
    }
    int status = 0;
    ASSERT_EQ(::waitpid(child, &status, 0), child);
    EXPECT_EQ(status, 0) << gone.size() << " files gone";
    allow(perms{0700}, perms{0600});
  }
}

}  // namespace
