// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/files/FileLock.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <sys/sysmacros.h>

#include <algorithm>
#include <array>
#include <cstdio>
#include <memory>
#include <system_error>
#include <thread>
#include <utility>

#include "base/Text.h"
#include "host/files/SystemError.h"

namespace host {

namespace {

using std::chrono::milliseconds;

constexpr milliseconds kUntilSaid = std::chrono::seconds(1);
constexpr milliseconds kMaxPause{50};

// Who holds the lock, as the kernel lists it; "another process" where it doesn't say.
std::string holderOf(int file) {
  struct stat status;
  const std::unique_ptr<std::FILE, int (*)(std::FILE*)> list(std::fopen("/proc/locks", "re"),
                                                             std::fclose);
  std::array<char, 256> line;
  while (list && ::fstat(file, &status) == 0 && std::fgets(line.data(), line.size(), list.get())) {
    int process = 0;
    unsigned int major = 0, minor = 0;
    unsigned long long inode = 0;
    // A line that begins with an arrow is of one who waits.
    if (std::sscanf(line.data(), "%*d: FLOCK %*s %*s %d %x:%x:%llu", &process, &major, &minor,
                    &inode) == 4 &&
        process > 0 && inode == status.st_ino && major == ::major(status.st_dev) &&
        minor == ::minor(status.st_dev)) {
      return base::format("process %d", process);
    }
  }
  return "another process";
}

}  // namespace

void LockWait::sleepFor(milliseconds time) { std::this_thread::sleep_for(time); }

base::Result<FileLock> FileLock::take(int file, const LockWait& wait) {
  milliseconds waited{0}, pause{1};
  bool said = false;
  while (::flock(file, LOCK_EX | LOCK_NB) != 0) {
    if (errno == EINTR) continue;
    if (errno != EWOULDBLOCK) return systemError();
    if (waited >= wait.limit) {
      const double seconds = std::chrono::duration<double>(wait.limit).count();
      return base::Error{
          base::format("locked by %s for more than %g s", holderOf(file).c_str(), seconds),
          std::errc::timed_out};
    }
    if (waited >= kUntilSaid && !std::exchange(said, true)) {
      wait.log.log(platform::LogLevel::standard, "Waiting for %s, which holds the lock on %s",
                   holderOf(file).c_str(), wait.path.c_str());
    }
    wait.pause(pause);
    waited += pause;
    pause = std::min(pause * 2, kMaxPause);
  }
  return FileLock(file);
}

FileLock::FileLock(FileLock&& other) noexcept : file_(std::exchange(other.file_, -1)) {}

FileLock::~FileLock() {
  if (file_ >= 0) ::flock(file_, LOCK_UN);
}

}  // namespace host
