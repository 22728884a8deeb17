// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include <gtest/gtest.h>
#include <signal.h>
#include <sys/wait.h>

#include <algorithm>
#include <cstdint>
#include <filesystem>
#include <functional>
#include <iterator>
#include <random>
#include <sstream>

#include "counter_store_support.h"

namespace {

using support::StoreFixture;

pid_t inChild(const std::function<bool()>& work) {
  const pid_t child = ::fork();
  if (child == 0) ::_exit(work() ? 0 : 1);
  return child;
}

int statusOf(pid_t child) {
  int status = -1;
  ::waitpid(child, &status, 0);
  return status;
}

TEST(CounterStoreProcesses, NoWriteIsLostBetweenWritersAndACheckpointer) {
  constexpr int writers = 4, rounds = 150;
  const support::TemporaryFolder folder;
  std::vector<pid_t> children;
  for (int writer = 0; writer < writers; ++writer) {
    children.push_back(inChild([&] {
      StoreFixture there(folder.path());
      there.sleeps = true;
      for (int i = 0; i < rounds; ++i) {
        if (!there.store.add("sum", 1, 1)) return false;
        if (!there.store.push("series", i, 1, writer)) return false;
      }
      return there.damaged == 0;
    }));
  }
  children.push_back(inChild([&] {
    StoreFixture there(folder.path());
    there.sleeps = true;
    for (int i = 0; i < 30; ++i) {
      there.store.PLClientCheckpoint();
      there.rows();
    }
    return there.log.lines().empty();
  }));
  for (const pid_t child : children) EXPECT_EQ(statusOf(child), 0);

  StoreFixture here(folder.path());
  const auto lines = here.rows();
  ASSERT_EQ(lines.size(), 2u);
  EXPECT_EQ(lines[0], "1 sum " + std::to_string(writers * rounds));
  // Each writer's samples are there, once and in order.
  std::vector<int> next(writers, 0);
  std::istringstream samples(lines[1].substr(lines[1].find("series ") + 7));
  char colon = 0;
  for (int writer = 0, sample = 0; samples >> writer >> colon >> sample;) {
    EXPECT_EQ(sample, next.at(static_cast<std::size_t>(writer))++);
  }
  EXPECT_EQ(next, std::vector<int>(writers, rounds));
}

TEST(CounterStoreProcesses, OneOfSeveralSetsADamagedDatabaseAside) {
  for (int round = 0; round < 10; ++round) {
    const support::TemporaryFolder folder;
    folder.write(support::kDatabase, std::string(9000, 'x'));
    std::vector<pid_t> children;
    for (int i = 0; i < 3; ++i) {
      children.push_back(inChild([&] {
        StoreFixture there(folder.path());
        there.sleeps = true;
        there.rows();
        const auto sound = there.store.add("sum", 1, 1);
        if (there.damaged > 0) folder.write("found/" + std::to_string(::getpid()), "");
        return sound && there.damaged <= 1;
      }));
    }
    for (const pid_t child : children) EXPECT_EQ(statusOf(child), 0);
    StoreFixture here(folder.path());
    EXPECT_EQ(here.rows(), std::vector<std::string>{"1 sum 3"});
    const auto found = std::filesystem::directory_iterator(folder / "found");
    EXPECT_EQ(std::distance(begin(found), end(found)), 1);
  }
}

// The child acknowledges each write with a byte and is killed after as many as chance decides: at
// any place of the writes and checkpoints that follow.
TEST(CounterStoreProcesses, AKilledWriterLosesNoAcknowledgedWrite) {
  std::mt19937 random(1);
  const support::TemporaryFolder folder;
  std::int64_t least = 0;
  for (int round = 0; round < 40; ++round) {
    int ends[2];
    ASSERT_EQ(::pipe(ends), 0);
    const pid_t child = inChild([&] {
      StoreFixture there(folder.path());
      for (int i = 0;; ++i) {
        if (!there.store.push("k", 1, 1, 0)) return false;
        if (::write(ends[1], "+", 1) != 1) return false;
        if (i % 5 == 4) there.store.PLClientCheckpoint();
      }
    });
    ::close(ends[1]);
    char acknowledged[64];
    for (std::size_t until = 1 + random() % 40, seen = 0; seen < until;) {
      const ssize_t got = ::read(ends[0], acknowledged, 1 + random() % sizeof acknowledged);
      if (got <= 0) break;
      seen += static_cast<std::size_t>(got);
      least += got;
    }
    ::kill(child, SIGKILL);
    EXPECT_EQ(statusOf(child), SIGKILL);
    for (ssize_t got; (got = ::read(ends[0], acknowledged, sizeof acknowledged)) > 0;) least += got;
    ::close(ends[0]);

    StoreFixture here(folder.path());
    std::int64_t held = 0;  // one sample for each colon
    for (const auto& line : here.rows()) held += std::count(line.begin(), line.end(), ':');
    // One write of each round may be in without its acknowledgement.
    EXPECT_GE(held, least);
    EXPECT_LE(held, least + 1);
    least = held;
    EXPECT_EQ(here.damaged, 0);
    EXPECT_EQ(here.log.lines(), std::vector<std::string>{});
  }
}

}  // namespace
