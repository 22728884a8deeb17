// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sqlite3.h>
#include <unistd.h>

#include <cerrno>
#include <cstdint>

#include "counter_store_support.h"

namespace {

using support::StoreFixture;

// SQLite's system calls on files, the n-th of which fails with an error number.
struct Fault {
  static inline int callsLeft = 0;  // 0: none fails
  static inline int error = 0;

  static bool strikes() {
    if (callsLeft == 0 || --callsLeft > 0) return false;
    errno = error;
    return true;
  }
};

template <auto original>
struct Failing;
template <typename R, typename... A, R (*original)(A...)>
struct Failing<original> {
  static R call(A... arguments) { return Fault::strikes() ? R{-1} : original(arguments...); }
};

int openFile(const char* path, int flags, int mode) {
  return ::open(path, flags, static_cast<mode_t>(mode));
}

struct Call {
  const char* name;
  sqlite3_syscall_ptr failing;
};
template <auto original>
Call call(const char* name) {
  return {name, reinterpret_cast<sqlite3_syscall_ptr>(&Failing<original>::call)};
}

// Disk errors must neither lose what was acknowledged nor pass for damage, which would set a sound
// database aside.
TEST(CounterStoreFaults, AFailingDiskLosesNothingAndIsNotTakenForDamage) {
  const std::vector<Call> calls[] = {
      {call<&openFile>("open")},
      {call<&::pread>("pread"), call<&::pread64>("pread64")},
      {call<&::pwrite>("pwrite"), call<&::pwrite64>("pwrite64")},
      {call<&::ftruncate>("ftruncate")},
      {call<&::fstat>("fstat")},
  };
  sqlite3_vfs* files = sqlite3_vfs_find(nullptr);
  int failures = 0;
  for (const auto& names : calls) {
    for (const auto& each : names) files->xSetSystemCall(files, each.name, each.failing);
    for (const int error : {EIO, ENOSPC}) {
      bool struck = true;
      for (int nth = 1; struck; ++nth) {
        SCOPED_TRACE(testing::Message() << names[0].name << " " << nth << " errno " << error);
        const support::TemporaryFolder folder;
        ASSERT_TRUE(StoreFixture(folder.path()).store.add("k", 10, 1));
        std::int64_t sum = 10;
        Fault::error = error;
        Fault::callsLeft = nth;
        {
          StoreFixture here(folder.path());
          here.rows();
          sum += here.store.add("k", 1, 1) ? 1 : 0;
          here.store.PLClientCheckpoint();
          sum += here.store.add("k", 1, 1) ? 1 : 0;
          EXPECT_EQ(here.damaged, 0);
        }
        struck = Fault::callsLeft == 0;
        failures += struck ? 1 : 0;
        Fault::callsLeft = 0;
        StoreFixture after(folder.path());
        EXPECT_EQ(after.rows(), std::vector<std::string>{"1 k " + std::to_string(sum)});
      }
    }
    for (const auto& each : names) files->xSetSystemCall(files, each.name, nullptr);
  }
  EXPECT_GT(failures, 100);
}

}  // namespace
