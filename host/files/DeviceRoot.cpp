#include "host/files/DeviceRoot.h"

#include <fcntl.h>
#include <linux/openat2.h>
#include <sys/stat.h>
#include <sys/syscall.h>

#include <cerrno>
#include <cstring>

#include "host/files/Files.h"

namespace host {

namespace {

std::string relative(std::string_view path) {
  const auto start = path.find_first_not_of('/');
  return start == std::string_view::npos ? "." : std::string(path.substr(start));
}

}  // namespace

DeviceRoot::DeviceRoot(std::string path)
    : path_(std::move(path)),
      root_(::open(path_.c_str(), O_PATH | O_DIRECTORY | O_CLOEXEC)),
      error_(root_ ? 0 : errno) {}

std::string DeviceRoot::problem(const char* what) const {
  return error_ == 0 ? "" : std::string(what) + " " + path_ + ": " + std::strerror(error_);
}

bool DeviceRoot::isRecorded() const {
  // A folder that is there and can't be looked at is one all the same.
  return open("device", O_PATH | O_DIRECTORY, Links::followed) ||
         (errno != ENOENT && errno != ENOTDIR);
}

std::string DeviceRoot::hostPath(std::string_view path) const {
  std::string hostPath = path_;
  if (!hostPath.ends_with('/')) hostPath += '/';
  return hostPath + relative(path);
}

std::string DeviceRoot::hostPath(std::string_view folder, std::string_view name) const {
  return hostPath(folder) + (name.empty() ? "" : "/" + shownText(name));
}

FileDescriptor DeviceRoot::open(const std::string& path, int flags, Links links) const {
  if (!root_ || path.find('\0') != std::string::npos) {
    errno = ENOENT;
    return {};
  }
  open_how how{};
  how.flags = static_cast<std::uint64_t>(flags | O_CLOEXEC);
  how.resolve = links == Links::followed ? RESOLVE_IN_ROOT : RESOLVE_IN_ROOT | RESOLVE_NO_SYMLINKS;
  // EAGAIN: somebody renamed folders while ".." or a link was followed.
  for (int attempts = 64;; --attempts) {
    const auto file =
        static_cast<int>(::syscall(SYS_openat2, root_.get(), path.c_str(), &how, sizeof how));
    if (file >= 0) return FileDescriptor(file);
    // ENOSYS: an old kernel, or a sandbox that can't look into the call's structure and refuses it.
    // Some sandboxes say EPERM, which the walk meets again if it was meant for the file.
    if (errno == ENOSYS || errno == EPERM) return openByWalk(root_.get(), path, flags, links);
    if (attempts == 0 || (errno != EAGAIN && errno != EINTR)) return {};
  }
}

FileDescriptor DeviceRoot::openForReading(std::string_view path) const {
  return open(relative(path), O_RDONLY | O_NONBLOCK | O_NOCTTY, Links::followed);
}

FileDescriptor DeviceRoot::openForStatus(std::string_view path) const {
  return open(relative(path), O_PATH, Links::followed);
}

base::Result<std::string> DeviceRoot::readFile(std::string_view path, std::size_t maximum) const {
  const FileDescriptor file = openForReading(path);
  if (!file) return base::Error{std::strerror(errno)};
  return readRegularFile(file.get(), maximum);
}

FileDescriptor DeviceRoot::openFolder(std::string_view path, Missing missing, Links links) const {
  const std::string folder = relative(path);
  const int flags = O_RDONLY | O_DIRECTORY;
  FileDescriptor opened = open(folder, flags, links);
  if (opened || errno != ENOENT || missing == Missing::fails) return opened;
  // Something is missing: make one part after the other, each below its parent.
  for (std::size_t end = folder.find('/');; end = folder.find('/', end + 1)) {
    const std::string upTo = folder.substr(0, end);
    opened = open(upTo, flags, links);
    if (!opened && errno == ENOENT) {
      const auto slash = upTo.rfind('/');
      const std::string parent = slash == std::string::npos ? "." : upTo.substr(0, slash);
      const std::string name = slash == std::string::npos ? upTo : upTo.substr(slash + 1);
      const FileDescriptor above = open(parent, flags, links);
      if (!above) return {};
      if (::mkdirat(above.get(), name.c_str(), 0700) != 0 && errno != EEXIST) return {};
      if (::fsync(above.get()) != 0) return {};
      opened = open(upTo, flags, links);
    }
    if (!opened || end == std::string::npos) return opened;
  }
}

}  // namespace host
