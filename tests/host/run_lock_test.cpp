// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

#include <atomic>
#include <filesystem>
#include <thread>

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

TEST(RunLockFile, TheFolderMayBeTheSystemsOwnLink) {
  support::HostServices host;
  std::filesystem::create_directories(host.folder / "run");
  std::filesystem::create_directories(host.folder / "var");
  std::filesystem::create_symlink("/run", host.folder / "var/run");
  RunLockFile(host.root, host.log).lock();
  EXPECT_TRUE(std::filesystem::exists(host.folder / "run/morvend.lock"));
}

}  // namespace
}  // namespace host
