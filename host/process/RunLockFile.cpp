// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/process/RunLockFile.h"

#include <fcntl.h>
#include <sys/stat.h>

#include "host/files/Ownership.h"
#include "host/files/SystemError.h"

namespace host {

namespace {

constexpr char kAbove[] = "/var", kFolder[] = "/var/run";
constexpr char kName[] = "morvend.lock";

base::Result<FileDescriptor> openLockFile(const DeviceRoot& root) {
  // Of the two only run/ may be the system's own link.
  const auto above = root.openFolder(kAbove, DeviceRoot::Missing::create);
  if (!above) return above.error();
  const auto folder =
      root.openFolder(kFolder, DeviceRoot::Missing::create, DeviceRoot::Links::followed);
  if (!folder) return folder.error();
  const AsOwnerOf owner(folder->get());
  auto file =
      opened(::openat(folder->get(), kName,
                      O_RDWR | O_CREAT | O_NOFOLLOW | O_NONBLOCK | O_NOCTTY | O_CLOEXEC, 0600));
  if (!file) return file;
  struct stat status;
  if (::fstat(file->get(), &status) != 0) return systemError();
  if (!S_ISREG(status.st_mode)) return notRegular();
  return file;
}

}  // namespace

base::Result<void> RunLockFile::take() {
  auto file = root_.patience()([this] { return openLockFile(root_); });
  if (!file) return file.error();
  auto lock = FileLock::take(file->get(), {log_, root_.hostPath(kFolder, kName), kMaxWait, pause_});
  if (!lock) return lock.error();
  file_ = *std::move(file);
  lock_.emplace(*std::move(lock));
  return {};
}

void RunLockFile::lock() {
  const auto taken = take();
  if (taken) return;
  log_.log(platform::LogLevel::error, "Could not lock %s: %s; running without the lock",
           root_.hostPath(kFolder, kName).c_str(), taken.error().text.c_str());
}

void RunLockFile::unlock() {
  lock_.reset();
  file_ = FileDescriptor();
}

}  // namespace host
