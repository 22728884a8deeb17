#include "host/files/Files.h"

#include <dirent.h>
#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <memory>
#include <tuple>

namespace host {

namespace {

// 0 for a regular file or for no file at all.
int refuseOtherKinds(int folder, const std::string& name) {
  struct stat status;
  if (::fstatat(folder, name.c_str(), &status, AT_SYMLINK_NOFOLLOW) != 0) {
    return errno == ENOENT ? 0 : errno;
  }
  return S_ISREG(status.st_mode) ? 0 : EINVAL;
}

// The size of the file without the unfinished line at its end.
off_t sizeOfWholeLines(int file, off_t size) {
  std::array<char, 4096> block;
  while (size > 0) {
    const auto length = static_cast<std::size_t>(std::min<off_t>(size, block.size()));
    const off_t start = size - static_cast<off_t>(length);
    if (::pread(file, block.data(), length, start) != static_cast<ssize_t>(length)) return size;
    for (std::size_t i = length; i > 0; --i) {
      if (block[i - 1] == '\n') return start + static_cast<off_t>(i);
    }
    size = start;
  }
  return 0;
}

}  // namespace

const char* errorText(int error) {
  if (error == ELOOP) return "too many links, or one where none is followed";
  if (error == EMLINK) return "a file with several names";
  return error == EINVAL ? "not a regular file" : std::strerror(error);
}

base::Result<std::string> readRegularFile(int file, std::size_t maximum) {
  struct stat status;
  if (::fstat(file, &status) != 0) return base::Error{std::strerror(errno)};
  if (!S_ISREG(status.st_mode)) return base::Error{errorText(EINVAL)};
  std::string bytes;
  bytes.resize(std::min(maximum, static_cast<std::size_t>(status.st_size)));
  std::size_t filled = 0;
  while (filled < bytes.size()) {
    const ssize_t got = ::read(file, bytes.data() + filled, bytes.size() - filled);
    if (got < 0 && errno == EINTR) continue;
    if (got < 0) return base::Error{std::strerror(errno)};
    if (got == 0) break;
    filled += static_cast<std::size_t>(got);
  }
  bytes.resize(filled);
  return bytes;
}

int namesInFolder(int folder, std::vector<std::string>& names) {
  // A description of its own, because the place in the listing belongs to the description.
  const int again = ::openat(folder, ".", O_RDONLY | O_DIRECTORY | O_CLOEXEC);
  if (again < 0) return errno;
  const auto close = [](DIR* listing) { ::closedir(listing); };
  const std::unique_ptr<DIR, decltype(close)> listing(::fdopendir(again), close);
  if (listing == nullptr) {
    ::close(again);
    return ENOMEM;
  }
  errno = 0;
  while (const dirent* entry = ::readdir(listing.get())) {
    const std::string_view name = entry->d_name;
    if (name != "." && name != "..") names.emplace_back(name);
    errno = 0;
  }
  const int error = errno;
  std::sort(names.begin(), names.end());
  return error;
}

bool isPlainFileName(std::string_view name, std::size_t longest) {
  return !name.empty() && name != "." && name != ".." && name.size() <= longest &&
         name.find('/') == std::string_view::npos && name.find('\0') == std::string_view::npos;
}

std::string shownText(std::string_view text) {
  constexpr std::size_t kLongest = 80;
  std::string shown(text.substr(0, kLongest));
  std::replace_if(
      shown.begin(), shown.end(), [](unsigned char c) { return c < 0x20 || c == 0x7f; }, '?');
  return text.size() > kLongest ? shown + "..." : shown;
}

int writeAll(int file, std::string_view bytes) {
  while (!bytes.empty()) {
    const ssize_t written = ::write(file, bytes.data(), bytes.size());
    if (written < 0 && errno == EINTR) continue;
    if (written < 0) return errno;
    if (written == 0) return EIO;
    bytes.remove_prefix(static_cast<std::size_t>(written));
  }
  return 0;
}

int replaceFile(int folder, const std::string& name, std::string_view bytes) {
  if (const int error = refuseOtherKinds(folder, name)) return error;
  const std::string beside = "." + name + ".new";
  if (::unlinkat(folder, beside.c_str(), 0) != 0 && errno != ENOENT) return errno;
  const FileDescriptor file(
      ::openat(folder, beside.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, 0600));
  if (!file) return errno;
  int error = writeAll(file.get(), bytes);
  if (error == 0 && ::fsync(file.get()) != 0) error = errno;
  if (error == 0 && ::renameat(folder, beside.c_str(), folder, name.c_str()) != 0) error = errno;
  if (error != 0) {
    ::unlinkat(folder, beside.c_str(), 0);
    return error;
  }
  return ::fsync(folder) == 0 ? 0 : errno;
}

int renameToFreeName(int fromFolder, const std::string& from, int toFolder, const std::string& to) {
  return ::renameat2(fromFolder, from.c_str(), toFolder, to.c_str(), RENAME_NOREPLACE) == 0 ? 0
                                                                                            : errno;
}

bool isLink(int folder, const std::string& name) {
  struct stat status;
  return ::fstatat(folder, name.c_str(), &status, AT_SYMLINK_NOFOLLOW) == 0 &&
         S_ISLNK(status.st_mode);
}

RolledOver rollOver(int folder, const std::string& name, int oldest) {
  RolledOver rolled;
  std::vector<std::string> places;  // each moves to the next
  bool free = false;
  for (int number = 0; number <= oldest && !free; ++number) {
    rolled.at = number == 0 ? name : name + "." + std::to_string(number);
    struct stat status;
    free = ::fstatat(folder, rolled.at.c_str(), &status, AT_SYMLINK_NOFOLLOW) != 0;
    if (free && errno != ENOENT) {
      rolled.error = errno;
      return rolled;
    }
    if (free || S_ISREG(status.st_mode)) {
      places.push_back(rolled.at);
    } else if (number == 0) {
      rolled.error = EINVAL;
      return rolled;
    } else {
      rolled.inTheWay.push_back(rolled.at);
    }
  }
  if (places.size() == 1 && !free) {
    rolled.error = EINVAL;
    rolled.at = rolled.inTheWay.front();
    return rolled;
  }
  for (std::size_t place = places.size() - 1; place > 0; --place) {
    rolled.at = places[place - 1];
    if (::renameat(folder, rolled.at.c_str(), folder, places[place].c_str()) != 0) {
      rolled.error = errno;
      return rolled;
    }
  }
  rolled.at = free ? "" : places.back();
  return rolled;
}

int appendLines(int folder, const std::string& name, std::string_view lines) {
  const FileDescriptor file(
      ::openat(folder, name.c_str(),
               O_RDWR | O_CREAT | O_APPEND | O_NOFOLLOW | O_NONBLOCK | O_NOCTTY | O_CLOEXEC, 0600));
  if (!file) return errno == ELOOP || errno == EISDIR ? EINVAL : errno;
  const FileLock lock(file.get());
  struct stat status;
  if (::fstat(file.get(), &status) != 0) return errno;
  if (!S_ISREG(status.st_mode)) return EINVAL;
  if (status.st_nlink > 1) return EMLINK;
  const off_t whole = sizeOfWholeLines(file.get(), status.st_size);
  if (whole != status.st_size && ::ftruncate(file.get(), whole) != 0) return errno;
  const int error = writeAll(file.get(), lines);
  // Where this fails too, the next call removes the unfinished line.
  if (error != 0) std::ignore = ::ftruncate(file.get(), whole);
  return error;
}

FileLock::FileLock(int file) : file_(file) {
  while (::flock(file_, LOCK_EX) != 0 && errno == EINTR) {
  }
}

FileLock::~FileLock() { ::flock(file_, LOCK_UN); }

}  // namespace host
