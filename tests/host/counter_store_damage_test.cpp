// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <filesystem>
#include <random>

#include "counter_store_support.h"

namespace {

using host::CounterChange;
using support::StoreFixture;

const std::string kLog = std::string(support::kDatabase) + "-wal";

// A database with some pages of each kind, in the file and in the log.
void fill(host::CounterStore& store) {
  std::vector<std::string> keys;
  for (int i = 0; i < 80; ++i) keys.push_back("some.counter." + std::to_string(i));
  for (const bool early : {true, false}) {
    std::vector<CounterChange> changes;
    for (std::int32_t day = early ? 0 : 40; day < (early ? 50 : 70); day += 10) {
      for (const auto& key : keys) {
        changes.push_back(
            {.kind = CounterChange::Kind::set, .key = key, .day = day, .amount = day});
        if (changes.size() % 4 == 0) {
          changes.insert(changes.end(), 5,
                         {.kind = CounterChange::Kind::push, .key = key, .day = day, .sample = 1});
        }
      }
    }
    ASSERT_TRUE(store.apply(changes));
    if (early) store.PLClientCheckpoint();
  }
}

class Mutator {
 public:
  explicit Mutator(unsigned seed) : random_(seed) {}

  std::size_t below(std::size_t limit) { return limit == 0 ? 0 : random_() % limit; }

  // Flips bits, overwrites with a run of one byte, zeroes a page, moves a page, or cuts. Headers
  // and the beginnings of pages, where the structure is, get more than their share.
  void damage(std::string& bytes) {
    for (std::size_t n = 1 + below(4); n > 0 && !bytes.empty(); --n) {
      std::size_t at = below(bytes.size());
      if (below(2) == 0) at = at / 4096 * 4096 + below(below(2) == 0 ? 16 : 120);
      if (at >= bytes.size()) at = 0;
      const std::size_t page = at / 4096 * 4096;
      switch (below(6)) {
        case 0:
          bytes.resize(below(8) == 0 ? below(bytes.size()) : page);
          break;
        case 1:
          bytes.replace(page, 4096, std::min<std::size_t>(4096, bytes.size() - page), '\0');
          break;
        case 2:
          bytes.replace(page, 4096, bytes, below(bytes.size()) / 4096 * 4096, 4096);
          break;
        case 3:
          bytes.replace(at, 4, 4, static_cast<char>(below(2) == 0 ? 0xff : below(256)));
          break;
        default:
          bytes[at] = static_cast<char>(bytes[at] ^ (1 << below(8)));
      }
    }
  }

 private:
  std::mt19937 random_;
};

constexpr unsigned kSeeds = 1000, kParts = 4;

class SeededDamage : public testing::TestWithParam<unsigned> {};
INSTANTIATE_TEST_SUITE_P(CounterStore, SeededDamage, testing::Range(0u, kParts));

TEST_P(SeededDamage, NeverCrashesTheStoreAndWhatIsReportedIsSetAside) {
  // A disk would take minutes to synchronise a thousand databases.
  if (std::filesystem::is_directory("/dev/shm")) ::setenv("TMPDIR", "/dev/shm", 0);
  std::string database, log;
  {
    const support::TemporaryFolder folder;
    StoreFixture original(folder.path());
    fill(original.store);
    database = folder.read(support::kDatabase);
    log = folder.read(kLog);
  }
  int setAside = 0, kept = 0;
  for (unsigned seed = GetParam(); seed < kSeeds; seed += kParts) {
    SCOPED_TRACE(seed);
    Mutator mutator(seed);
    std::string damagedDatabase = database, damagedLog = log;
    mutator.damage(mutator.below(3) == 0 ? damagedLog : damagedDatabase);
    if (mutator.below(4) == 0) damagedLog.clear();

    const support::TemporaryFolder folder;
    StoreFixture here(folder.path());
    const bool whileOpen = mutator.below(4) == 0;
    if (whileOpen) {
      folder.write(support::kDatabase, database);
      folder.write(kLog, log);
      ASSERT_TRUE(here.store.add("some.counter.7", 1, 40));
    }
    folder.write(support::kDatabase, damagedDatabase);
    folder.write(kLog, damagedLog);

    bool newer = false;
    const auto writes = [&](const base::Result<void>& written) {
      newer =
          newer || (!written && written.error().text.find("newer version") != std::string::npos);
      EXPECT_TRUE(whileOpen || newer || written) << written.error().text;
    };
    const int steps = 4;
    for (std::size_t step = mutator.below(steps), i = 0; i < steps; ++i, ++step) {
      switch (step % steps) {
        case 0:
          here.rows();
          break;
        case 1:
          writes(here.store.set("some.counter.50", 9, 40));
          break;
        case 2:
          writes(here.store.push("some.counter.50", 9, 60, 9));
          break;
        default:
          here.store.PLClientCheckpoint();
      }
    }
    // Every line tells of damage, and each time the next write finds a store that works.
    EXPECT_EQ(here.damaged, here.log.count("set aside as"));
    EXPECT_EQ(std::filesystem::exists(folder / (std::string(support::kDatabase) + ".corrupt")),
              here.damaged > 0);
    if (here.damaged > 0) {
      ++setAside;
      EXPECT_LE(here.damaged, 2);
      EXPECT_TRUE(here.store.set("after", 5, 60));
      EXPECT_EQ(support::rows(*here.store.initWithDefaultPath(), here.log, "after"),
                std::vector<std::string>{"60 after 5"});
    } else {
      ++kept;
    }
  }
  // Both kinds must be met, or the damage is of no use.
  EXPECT_GT(setAside, 75);
  EXPECT_GT(kept, 25);
}

TEST(CounterStoreDamage, ASecondDamageReplacesTheFirstThatWasSetAside) {
  const support::TemporaryFolder folder;
  StoreFixture here(folder.path());
  for (const char* garbage : {"first", "second"}) {
    folder.write(support::kDatabase, std::string(5000, 'x') + garbage);
    folder.write(kLog, garbage);
    EXPECT_TRUE(here.store.add("k", 1, 1));
    EXPECT_EQ(here.rows(), std::vector<std::string>{"1 k 1"});
    const std::string aside = folder.read(std::string(support::kDatabase) + ".corrupt");
    EXPECT_TRUE(aside.ends_with(garbage));
    std::filesystem::remove(folder / support::kDatabase);
  }
  EXPECT_EQ(here.damaged, 2);
}

TEST(CounterStoreDamage, AHeaderThatForbidsWritingDoesNotDisableTheStoreForever) {
  for (const bool empty : {true, false}) {
    const support::TemporaryFolder folder;
    {
      StoreFixture original(folder.path());
      EXPECT_TRUE(original.store.set("k", 1, 1));
      if (!empty) original.store.PLClientCheckpoint();
    }
    std::string database = folder.read(support::kDatabase);
    database[18] = 7;  // the write version
    folder.write(support::kDatabase, database);
    folder.write(kLog, "");
    StoreFixture here(folder.path());
    EXPECT_TRUE(here.store.set("k", 2, 1)) << empty;
    EXPECT_EQ(here.damaged, 1) << empty;
  }
}

TEST(CounterStoreDamage, DamageThatCannotBeSetAsideIsSaidAndNotCounted) {
  const support::TemporaryFolder folder;
  StoreFixture here(folder.path());
  folder.write(support::kDatabase, std::string(5000, 'x'));
  folder.write(std::string(support::kDatabase) + ".corrupt/in the way", "");
  EXPECT_FALSE(here.store.set("k", 1, 1));
  EXPECT_EQ(here.rows(), std::vector<std::string>{});
  EXPECT_EQ(here.damaged, 0);
  EXPECT_GE(here.log.count("can't be set aside"), 1);
}

}  // namespace
