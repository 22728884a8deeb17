#include "host/process/RunLockFile.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>

#include <cerrno>

#include "host/files/Files.h"

namespace host {

namespace {

constexpr char kFolder[] = "/var/run";
constexpr char kName[] = "morvend.lock";

// 0 or an error number, with `file` the open and locked file.
int openLocked(const DeviceRoot& root, FileDescriptor& file) {
  const FileDescriptor folder =
      root.openFolder(kFolder, DeviceRoot::Missing::create, DeviceRoot::Links::followed);
  if (!folder) return errno;
  FileDescriptor opened(::openat(folder.get(), kName,
                                 O_RDWR | O_CREAT | O_NOFOLLOW | O_NONBLOCK | O_NOCTTY | O_CLOEXEC,
                                 0600));
  if (!opened) return errno;
  struct stat status;
  if (::fstat(opened.get(), &status) != 0) return errno;
  if (!S_ISREG(status.st_mode)) return EINVAL;
  while (::flock(opened.get(), LOCK_EX) != 0) {
    if (errno != EINTR) return errno;
  }
  file = std::move(opened);
  return 0;
}

}  // namespace

void RunLockFile::lock() {
  if (const int error = openLocked(root_, file_)) {
    log_.log(platform::LogLevel::error, "Could not lock %s: %s; running without the lock",
             root_.hostPath(kFolder, kName).c_str(), errorText(error));
  }
}

void RunLockFile::unlock() { file_ = FileDescriptor(); }

}  // namespace host
