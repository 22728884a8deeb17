// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/files/DeviceRoot.h"

#include <cstdint>
#include <system_error>

#include <fcntl.h>
#include <linux/openat2.h>
#include <sys/stat.h>
#include <sys/syscall.h>

#include "host/files/Files.h"
#include "host/files/SystemError.h"

namespace host {

namespace {

std::string relative(std::string_view path) {
  const auto start = path.find_first_not_of('/');
  return start == std::string_view::npos ? "." : std::string(path.substr(start));
}

}  // namespace

DeviceRoot::DeviceRoot(std::string path, Patience::Pause pause)
    : path_(std::move(path)), patience_(std::move(pause)), root_(patience_([this] {
        return opened(::open(path_.c_str(), O_PATH | O_DIRECTORY | O_CLOEXEC));
      })) {}

base::Result<void> DeviceRoot::isThere(const char* what) const {
  if (!root_) return root_.error().at(std::string(what) + " " + path_);
  return {};
}

bool DeviceRoot::isRecorded() const {
  const auto device = open("device", O_PATH | O_DIRECTORY, Links::followed);
  // A folder that is there and can't be looked at is one all the same.
  return device || !(isMissing(device.error()) || device.error().is(std::errc::not_a_directory));
}

std::string DeviceRoot::hostPath(std::string_view path) const {
  std::string hostPath = path_;
  if (!hostPath.ends_with('/')) hostPath += '/';
  return hostPath + relative(path);
}

std::string DeviceRoot::hostPath(std::string_view folder, std::string_view name) const {
  return hostPath(folder) + (name.empty() ? "" : "/" + shownText(name));
}

base::Result<FileDescriptor> DeviceRoot::open(const std::string& path, int flags,
                                              Links links) const {
  return patience_([&] { return openOnce(path, flags, links); });
}

base::Result<FileDescriptor> DeviceRoot::openOnce(const std::string& path, int flags,
                                                  Links links) const {
  if (!root_ || path.find('\0') != std::string::npos) return systemError(ENOENT);
  open_how how{};
  how.flags = static_cast<std::uint64_t>(flags | O_CLOEXEC);
  how.resolve = links == Links::followed ? RESOLVE_IN_ROOT : RESOLVE_IN_ROOT | RESOLVE_NO_SYMLINKS;
  // EAGAIN: somebody renamed folders while ".." or a link was followed.
  for (int attempts = 64;; --attempts) {
    const auto file =
        static_cast<int>(::syscall(SYS_openat2, root_->get(), path.c_str(), &how, sizeof how));
    // ENOSYS: an old kernel, or a sandbox that can't look into the call's structure and refuses it.
    // Some sandboxes say EPERM, which the walk meets again if it was meant for the file.
    if (file < 0 && (errno == ENOSYS || errno == EPERM)) {
      return openByWalk(root_->get(), path, flags, links);
    }
    if (file >= 0 || attempts == 0 || (errno != EAGAIN && errno != EINTR)) return opened(file);
  }
}

base::Result<FileDescriptor> DeviceRoot::openForReading(std::string_view path) const {
  return open(relative(path), O_RDONLY | O_NONBLOCK | O_NOCTTY, Links::followed);
}

base::Result<FileDescriptor> DeviceRoot::openForStatus(std::string_view path) const {
  return open(relative(path), O_PATH, Links::followed);
}

base::Result<std::string> DeviceRoot::readFile(std::string_view path, std::size_t maximum) const {
  return openForReading(path).and_then([&](const FileDescriptor& file) {
    return patience_([&] { return readRegularFile(file.get(), maximum); });
  });
}

bool DeviceRoot::takeMemory(std::size_t bytes) const {
  std::size_t left = memoryLeft_;
  while (bytes <= left) {
    if (memoryLeft_.compare_exchange_weak(left, left - bytes)) return true;
  }
  return false;
}

base::Result<FileDescriptor> DeviceRoot::openFolder(std::string_view path, Missing missing,
                                                    Links links) const {
  const std::string folder = relative(path);
  const int flags = O_RDONLY | O_DIRECTORY;
  auto found = open(folder, flags, links);
  if (found || !isMissing(found.error()) || missing == Missing::fails) return found;
  return patience_([&] { return make(folder, flags, links); });
}

// Something of the folder's path is missing: makes one part after the other, each below its parent.
base::Result<FileDescriptor> DeviceRoot::make(const std::string& folder, int flags,
                                              Links links) const {
  for (std::size_t end = folder.find('/');; end = folder.find('/', end + 1)) {
    const std::string upTo = folder.substr(0, end);
    auto found = openOnce(upTo, flags, links);
    if (!found && isMissing(found.error())) {
      const auto slash = upTo.rfind('/');
      const std::string parent = slash == std::string::npos ? "." : upTo.substr(0, slash);
      const std::string name = slash == std::string::npos ? upTo : upTo.substr(slash + 1);
      const auto above = openOnce(parent, flags, links);
      if (!above) return above.error();
      const auto made = makeFolder(above->get(), name);
      if (!made && !made.error().is(std::errc::file_exists)) return made.error();
      if (const auto synced = checked(::fsync(above->get())); !synced) return synced.error();
      found = openOnce(upTo, flags, links);
    }
    if (!found || end == std::string::npos) return found;
  }
}

}  // namespace host
