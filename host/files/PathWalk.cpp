// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/files/PathWalk.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <climits>
#include <string>
#include <vector>

#include "host/files/SystemError.h"

namespace host {

namespace {

constexpr int kMaxLinks = 40;                                 // as the kernel's
constexpr std::size_t kMaxPath = std::size_t{16} * PATH_MAX;  // with what links add to it

// Where an open link leads.
base::Result<std::string> targetOf(int link) {
  std::array<char, PATH_MAX> text;
  const ssize_t length = ::readlinkat(link, "", text.data(), text.size());
  if (length < 0) return systemError();
  if (length == 0) return systemError(ENOENT);
  if (length == ssize_t{PATH_MAX}) return systemError(ENAMETOOLONG);
  return std::string(text.data(), static_cast<std::size_t>(length));
}

// The folders on the way, so that ".." leads back to where the walk came from, whatever is renamed
// meanwhile. The first is borrowed.
class Way {
 public:
  explicit Way(int top) : top_(top) {}
  int here() const { return below_.empty() ? top_ : below_.back().get(); }
  void enter(FileDescriptor folder) { below_.push_back(std::move(folder)); }
  void leave() {
    if (!below_.empty()) below_.pop_back();
  }
  void restart() { below_.clear(); }

 private:
  int top_;
  std::vector<FileDescriptor> below_;
};

// The next part of a path, taken off its front; empty when there is none.
std::string takePart(std::string& path) {
  const std::size_t start = std::min(path.find_first_not_of('/'), path.size());
  const std::size_t end = std::min(path.find('/', start), path.size());
  std::string part = path.substr(start, end - start);
  path.erase(0, end);
  return part;
}

}  // namespace

base::Result<FileDescriptor> openByWalk(int folder, std::string_view path, int flags, Links links) {
  Way way(folder);
  std::string rest(path);
  int followed = 0;
  for (;;) {
    const std::string part = takePart(rest);
    if (part.empty()) return opened(::openat(way.here(), ".", flags | O_CLOEXEC));
    if (part == ".") continue;
    if (part == "..") {
      way.leave();
      continue;
    }
    auto found = opened(::openat(way.here(), part.c_str(), O_PATH | O_NOFOLLOW | O_CLOEXEC));
    if (!found) return found;
    struct stat status;
    if (::fstat(found->get(), &status) != 0) return systemError();
    if (S_ISLNK(status.st_mode)) {
      if (links == Links::refused || ++followed > kMaxLinks) return systemError(ELOOP);
      const auto target = targetOf(found->get());
      if (!target) return target.error();
      if (target->size() + rest.size() > kMaxPath) return systemError(ENAMETOOLONG);
      if (target->starts_with('/')) way.restart();
      rest.insert(0, *target);
    } else if (!rest.empty() || S_ISDIR(status.st_mode)) {
      // A folder, or what is taken for one by what follows it.
      if (!S_ISDIR(status.st_mode)) return systemError(ENOTDIR);
      way.enter(*std::move(found));
    } else if ((flags & O_PATH) != 0) {
      if ((flags & O_DIRECTORY) != 0) return systemError(ENOTDIR);
      return found;
    } else {
      // Should a link have taken its place meanwhile, it is refused.
      return opened(::openat(way.here(), part.c_str(), flags | O_NOFOLLOW | O_CLOEXEC));
    }
  }
}

}  // namespace host
