// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What the counters database refuses for now.

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sqlite3.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <chrono>
#include <cstdint>
#include <filesystem>
#include <memory>
#include <string>
#include <string_view>
#include <system_error>
#include <vector>

#include "counter_store_support.h"
#include "host/counters/WaitingChanges.h"

namespace {

using host::CounterChange;
using support::StoreFixture;
using Lines = std::vector<std::string>;
using std::chrono::seconds;

const std::string kJournal = std::string(support::kDatabase) + ".waiting";
const std::string kAside = kJournal + ".corrupt";

// Another program that has locked the database.
class Holder {
 public:
  Holder(const std::filesystem::path& file, const char* how) {
    EXPECT_EQ(sqlite3_open(file.c_str(), &database_), SQLITE_OK);
    EXPECT_EQ(sqlite3_exec(database_, how, nullptr, nullptr, nullptr), SQLITE_OK);
  }
  ~Holder() { sqlite3_close(database_); }

 private:
  sqlite3* database_ = nullptr;
};
constexpr char kWrites[] = "BEGIN IMMEDIATE";
constexpr char kExcludes[] =
    "PRAGMA locking_mode = EXCLUSIVE; BEGIN IMMEDIATE; UPDATE scalars SET value = value; COMMIT";

class CounterStoreWaiting : public testing::Test {
 protected:
  CounterStoreWaiting() { EXPECT_TRUE(here.store.set("k", 1, 1)); }

  std::unique_ptr<Holder> holder(const char* how) {
    return std::make_unique<Holder>(folder / support::kDatabase, how);
  }
  Lines waiting() const {
    Lines names;
    if (!std::filesystem::exists(folder / kJournal)) return names;
    for (const auto& entry : std::filesystem::directory_iterator(folder / kJournal)) {
      names.push_back(entry.path().filename());
    }
    std::ranges::sort(names);
    return names;
  }

  support::TemporaryFolder folder;
  StoreFixture here{folder.path()};
};

TEST_F(CounterStoreWaiting, WhatALockedDatabaseRefusesIsRecordedOnceByWhoComesNext) {
  const Lines expected{"1 k 111", "1 k 5:2.5 6:3.5"};
  for (const bool reads : {true, false}) {
    StoreFixture there(folder.path());
    EXPECT_TRUE(there.store.set("k", 0, 1));
    auto locked = holder(kWrites);
    EXPECT_TRUE(there.store.set("k", 100, 1));
    EXPECT_GE(there.waited, seconds(3));
    EXPECT_LE(there.waited, seconds(8));
    EXPECT_TRUE(there.store.add("k", 10, 1)) << "after what waits already";
    EXPECT_LE(there.waited, seconds(10)) << "waited for again";
    const CounterChange changes[] = {
        {.kind = CounterChange::Kind::add, .key = "k", .day = 1, .amount = 1},
        {.kind = CounterChange::Kind::push, .key = "k", .day = 1, .sample = 2.5, .seconds = 5},
        {.kind = CounterChange::Kind::push, .key = "k", .day = 1, .sample = 3.5, .seconds = 6}};
    EXPECT_TRUE(there.store.apply(changes));
    EXPECT_EQ(waiting().size(), 3u);
    EXPECT_EQ(there.log.count("database is locked; what is to be recorded waits beside it"), 1);
    EXPECT_EQ(there.log.lines().size(), 1u);
    locked.reset();

    StoreFixture next(folder.path());
    if (!reads) next.store.PLClientCheckpoint();
    EXPECT_EQ(next.rows(), expected);
    EXPECT_EQ(waiting(), Lines{});
    EXPECT_TRUE(there.store.add("k", 0, 1));
    EXPECT_EQ(there.rows(), expected);
    EXPECT_EQ(support::sql(folder / support::kDatabase, "SELECT count(*) FROM sqlite_schema"), "4");
    EXPECT_EQ(next.waited.count() + next.damaged, 0);
    support::sql(folder / support::kDatabase, "DELETE FROM staged; DELETE FROM packed");
  }
}

// What a killed process leaves between its steps: recorded and not removed, or not yet finished.
TEST_F(CounterStoreWaiting, ABatchThatIsRecordedAlreadyIsOnlyRemoved) {
  auto locked = holder(kWrites);
  EXPECT_TRUE(here.store.add("k", 1, 1));
  EXPECT_TRUE(here.store.add("k", 1, 1));
  locked.reset();
  const Lines names = waiting();
  ASSERT_EQ(names.size(), 2u);
  folder.write(kJournal + "/." + names[0] + ".new", "unfinished");
  support::sql(folder / support::kDatabase,
               (std::string(host::kWaitingTable) + "; INSERT INTO waiting_recorded VALUES('" +
                names[0] + "')")
                   .c_str());
  EXPECT_EQ(here.rows(), Lines{"1 k 2"});
  EXPECT_EQ(waiting(), Lines{"." + names[0] + ".new"}) << "who writes it may be at it";
  std::filesystem::last_write_time(
      folder / (kJournal + "/" + waiting()[0]),
      std::filesystem::file_time_type::clock::now() - std::chrono::hours(2));
  EXPECT_TRUE(here.store.add("k", 1, 1));
  EXPECT_FALSE(std::filesystem::exists(folder / kJournal));
  EXPECT_EQ(here.rows(), Lines{"1 k 3"});
}

TEST_F(CounterStoreWaiting, AStoppedHolderOfTheStoresLockStopsNobody) {
  const auto database = (folder / support::kDatabase).parent_path();
  const int lock = ::open(database.c_str(), O_RDONLY | O_DIRECTORY);
  ASSERT_EQ(::flock(lock, LOCK_EX), 0);
  StoreFixture there(folder.path());
  for (int i = 0; i < 3; ++i) EXPECT_TRUE(there.store.add("k", 1, 1));
  EXPECT_GE(there.waited, seconds(30));
  EXPECT_LE(there.waited, seconds(31));
  EXPECT_EQ(there.log.count("Waiting for process " + std::to_string(::getpid())), 1);
  EXPECT_EQ(there.log.count("for more than 30 s; what is to be recorded waits beside it"), 1);
  EXPECT_EQ(there.rows(), Lines{"1 k 1"});
  EXPECT_EQ(there.log.count("it is read all the same"), 1);
  there.store.PLClientCheckpoint();
  EXPECT_EQ(::flock(lock, LOCK_UN), 0);
  EXPECT_EQ(there.rows(), Lines{"1 k 4"});
  ::close(lock);
}

TEST_F(CounterStoreWaiting, AReaderWaitsForAnExclusiveHolderAndSaysThatItMayTryAgain) {
  EXPECT_TRUE(here.store.settle());
  {
    const auto locked = holder(kExcludes);
    StoreFixture there(folder.path());
    const auto read = there.store.history()->scalarsForKeyPrefix(
        "", 0, 9, [](std::string_view, std::int32_t, std::int64_t, bool&) {});
    ASSERT_FALSE(read);
    EXPECT_TRUE(read.error().is(std::errc::resource_unavailable_try_again)) << read.error().text;
    EXPECT_GE(there.waited, seconds(3));
    EXPECT_LE(there.waited, seconds(8));
  }
  EXPECT_EQ(StoreFixture(folder.path()).rows(), Lines{"1 k 1"});
}

TEST_F(CounterStoreWaiting, TooMuchIsRefused) {
  const auto locked = holder(kWrites);
  const std::string key(host::kMaxWaitingBytes / 2, 'k');
  EXPECT_TRUE(here.store.add(key, 1, 1));
  EXPECT_NE(here.store.add(key, 1, 1).error().text.find("too much waits"), std::string::npos);
  EXPECT_TRUE(here.store.add("k", 1, 1));
  for (std::size_t i = waiting().size(); i < host::kMaxWaitingBatches; ++i) {
    folder.write(kJournal + "/" + std::to_string(i), "");
  }
  EXPECT_FALSE(here.store.add("k", 1, 1));
}

// Whatever lies in the journal, what is sound is recorded, and the rest is neither read nor met
// again.
TEST_F(CounterStoreWaiting, WhatIsNoBatchIsSetAside) {
  auto locked = holder(kWrites);
  EXPECT_TRUE(here.store.push("k", 1, 1, 1));
  const std::string first = waiting().front();
  const std::string batch = folder.read(kJournal + "/" + first);
  locked.reset();
  EXPECT_EQ(here.rows(), (Lines{"1 k 1", "1 k 1:1"}));
  const std::string name = "00000000000000ff-0123456789abcdef";
  std::vector<std::string> foreign{"", "garbage", batch + "more"};
  for (std::size_t size = 0; size < batch.size(); ++size) foreign.push_back(batch.substr(0, size));
  for (const std::size_t at : {8u, 16u, 33u}) {
    foreign.push_back(batch);
    foreign.back()[at] = '\x7f';
  }
  foreign.push_back(std::string(batch).replace(25, 8, 8, '\xff'));  // not a number
  for (const std::string& bytes : foreign) {
    folder.write(kJournal + "/" + name, bytes);
    EXPECT_EQ(here.rows(), (Lines{"1 k 1", "1 k 1:1"}));
    EXPECT_EQ(here.log.count(name + ": not a batch of changes; it is set aside as "), 1);
    EXPECT_EQ(folder.read(kAside), bytes);
    here.log.clear();
  }
  folder.write(kJournal + "/other", batch);
  folder.write("elsewhere", batch);
  std::filesystem::create_hard_link(folder / "elsewhere", folder / (kJournal + "/" + name));
  EXPECT_TRUE(here.store.add("k", 1, 1));
  EXPECT_EQ(here.log.count("it is set aside as "), 2);
  for (const support::Kind kind : support::kOtherKinds) {
    std::filesystem::remove_all(folder / kAside);
    std::filesystem::create_directories(folder / kJournal);
    support::put(kind, folder / (kJournal + "/" + name), folder / "target");
    EXPECT_TRUE(here.store.add("k", 1, 1));
    EXPECT_TRUE(support::untouched(kind, folder / kAside, folder / "target"));
    std::filesystem::remove(folder / "target");
  }
  EXPECT_EQ(here.rows(), (Lines{"1 k 6", "1 k 1:1"}));
  EXPECT_EQ(here.damaged, 0);
}

TEST_F(CounterStoreWaiting, NothingIsWrittenThroughWhatStandsInTheJournalsPlace) {
  for (const support::Kind kind :
       {support::Kind::link, support::Kind::danglingLink, support::Kind::fifo}) {
    support::put(kind, folder / kJournal, folder / "target");
    EXPECT_TRUE(here.store.add("k", 1, 1));
    const auto locked = holder(kWrites);
    const auto refused = here.store.add("k", 1, 1);
    EXPECT_NE(refused.error().text.find("the journal beside it is not a folder"), std::string::npos)
        << refused.error().text;
    EXPECT_TRUE(support::untouched(kind, folder / kJournal, folder / "target"));
    std::filesystem::remove(folder / kJournal);
    std::filesystem::remove(folder / "target");
  }
  EXPECT_EQ(here.rows(), Lines{"1 k 4"});
}

// What root leaves on another user's device, that user's programs can go on with.
TEST(CounterStoreOwner, WhatRootWritesBelongsToTheOwnerOfTheDevice) {
  constexpr uid_t kOwner = 65534;
  const support::TemporaryFolder folder;
  if (::geteuid() != 0) GTEST_SKIP() << "not root";
  ASSERT_EQ(::chown(folder.path().c_str(), kOwner, kOwner), 0);
  StoreFixture here(folder.path());
  EXPECT_TRUE(here.store.set("k", 1, 1));
  const Holder locked(folder / support::kDatabase, kWrites);
  EXPECT_TRUE(here.store.add("k", 1, 1));
  int files = 0;
  for (const auto& entry : std::filesystem::recursive_directory_iterator(folder.path())) {
    struct stat status;
    ASSERT_EQ(::lstat(entry.path().c_str(), &status), 0);
    EXPECT_EQ(status.st_uid, kOwner) << entry.path();
    EXPECT_EQ(status.st_gid, kOwner) << entry.path();
    files += entry.is_regular_file() ? 1 : 0;
  }
  EXPECT_EQ(files, 4) << "the database, two files beside it, and what waits";
}

}  // namespace
