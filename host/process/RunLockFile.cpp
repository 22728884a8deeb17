// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/process/RunLockFile.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>

#include "host/files/SystemError.h"

namespace host {

namespace {

constexpr char kFolder[] = "/var/run";
constexpr char kName[] = "morvend.lock";

base::Result<FileDescriptor> openLocked(const DeviceRoot& root) {
  const auto folder =
      root.openFolder(kFolder, DeviceRoot::Missing::create, DeviceRoot::Links::followed);
  if (!folder) return folder.error();
  auto file =
      opened(::openat(folder->get(), kName,
                      O_RDWR | O_CREAT | O_NOFOLLOW | O_NONBLOCK | O_NOCTTY | O_CLOEXEC, 0600));
  if (!file) return file;
  struct stat status;
  if (::fstat(file->get(), &status) != 0) return systemError();
  if (!S_ISREG(status.st_mode)) return notRegular();
  while (::flock(file->get(), LOCK_EX) != 0) {
    if (errno != EINTR) return systemError();
  }
  return file;
}

}  // namespace

void RunLockFile::lock() {
  if (auto file = openLocked(root_)) {
    file_ = *std::move(file);
  } else {
    log_.log(platform::LogLevel::error, "Could not lock %s: %s; running without the lock",
             root_.hostPath(kFolder, kName).c_str(), file.error().text.c_str());
  }
}

void RunLockFile::unlock() { file_ = FileDescriptor(); }

}  // namespace host
