// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

#include <atomic>
#include <chrono>
#include <filesystem>
#include <string>
#include <thread>
#include <vector>

#include "HostServices.h"
#include "host/process/RunLockFile.h"

namespace host {
namespace {

constexpr char kLock[] = "var/run/morvend.lock";

TEST(RunLockFile, TheSecondWaitsForTheFirst) {
  support::HostServices host;
  RunLockFile first(host.root, host.log), second(host.root, host.log);
  std::atomic<bool> released = false;
  first.lock();
  std::thread waiting([&] {
    second.lock();
    EXPECT_TRUE(released);
    second.unlock();
  });
  released = true;
  first.unlock();
  waiting.join();
  first.lock();
  first.unlock();
  EXPECT_TRUE(host.log.lines().empty());
}

TEST(RunLockFile, AProcessThatEndsGivesItBack) {
  support::HostServices host;
  const pid_t child = ::fork();
  ASSERT_GE(child, 0);
  if (child == 0) {
    RunLockFile(host.root, host.log).lock();
    ::_exit(0);
  }
  ASSERT_EQ(::waitpid(child, nullptr, 0), child);
  RunLockFile(host.root, host.log).lock();
  EXPECT_TRUE(std::filesystem::exists(host.folder / kLock));
}

// The holder is stopped, or means harm: who waits says so once, and goes on in the end.
TEST(RunLockFile, NoHolderStopsTheRun) {
  support::HostServices host;
  std::chrono::milliseconds waited{0};
  RunLockFile holder(host.root, host.log),
      waiting(host.root, host.log, [&](auto pause) { waited += pause; });
  holder.lock();
  waiting.lock();
  EXPECT_GE(waited, std::chrono::minutes(10));
  EXPECT_LE(waited, std::chrono::minutes(11));
  const std::string path = host.root.hostPath(kLock), who = "process " + std::to_string(::getpid());
  EXPECT_EQ(
      host.log.lines(),
      (std::vector<std::string>{"default: Waiting for " + who + ", which holds the lock on " + path,
                                "error: Could not lock " + path + ": locked by " + who +
                                    " for more than 600 s; running without the lock"}));
  waiting.unlock();
  holder.unlock();
  holder.lock();
}

TEST(RunLockFile, WithoutTheFileTheRunGoesOn) {
  for (const support::Kind kind : support::kOtherKinds) {
    support::HostServices host;
    const auto at = host.folder / kLock, target = host.folder / "target";
    support::put(kind, at, target);
    RunLockFile lock(host.root, host.log);
    lock.lock();
    lock.unlock();
    EXPECT_TRUE(support::untouched(kind, at, target));
    EXPECT_EQ(host.log.count("error: Could not lock " + host.root.hostPath(kLock) + ": "), 1);
  }
}

TEST(RunLockFile, OnlyItsFolderMayBeTheSystemsOwnLink) {
  support::HostServices host;
  std::filesystem::create_directories(host.folder / "run");
  std::filesystem::create_directories(host.folder / "var");
  std::filesystem::create_symlink("/run", host.folder / "var/run");
  RunLockFile(host.root, host.log).lock();
  EXPECT_TRUE(std::filesystem::exists(host.folder / "run/morvend.lock"));
  EXPECT_TRUE(host.log.lines().empty());
  // What else is a link is none of the system's.
  std::filesystem::rename(host.folder / "var", host.folder / "elsewhere");
  std::filesystem::create_symlink("elsewhere", host.folder / "var");
  std::filesystem::remove(host.folder / "run/morvend.lock");
  RunLockFile(host.root, host.log).lock();
  EXPECT_FALSE(std::filesystem::exists(host.folder / "run/morvend.lock"));
  EXPECT_EQ(host.log.count("error: Could not lock " + host.root.hostPath(kLock) + ": "), 1);
}

}  // namespace
}  // namespace host
