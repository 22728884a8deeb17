// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/files/Files.h"

#include <dirent.h>
#include <fcntl.h>
#include <sys/stat.h>

#include <algorithm>
#include <array>
#include <cstdio>
#include <memory>
#include <optional>
#include <system_error>
#include <tuple>

#include "host/files/Ownership.h"
#include "host/files/SystemError.h"

namespace host {

namespace {

base::Result<void> refuseLink(const struct stat& status) {
  if (S_ISLNK(status.st_mode)) return notRegular();
  if (S_ISREG(status.st_mode) && status.st_nlink > 1) return severalNames();
  return {};
}

// Succeeds for a file that may be written to.
base::Result<void> refuseOtherKinds(const struct stat& status) {
  if (!S_ISREG(status.st_mode)) return notRegular();
  return refuseLink(status);
}

// Of what has a name now; succeeds where nothing has it.
base::Result<void> refuseNamed(int folder, const std::string& name,
                               base::Result<void> (*refuse)(const struct stat& status)) {
  struct stat status;
  const auto found = checked(::fstatat(folder, name.c_str(), &status, AT_SYMLINK_NOFOLLOW));
  if (!found) return isMissing(found.error()) ? base::Result<void>() : found;
  return refuse(status);
}

std::string numbered(const std::string& name, int number) {
  return number == 1 ? name : name + "-" + std::to_string(number);
}

struct NewFile {
  std::string name;
  FileDescriptor file;
};

// An empty file under the first of the names beside that is free or can be made so.
base::Result<NewFile> makeBeside(int folder, const std::string& name) {
  for (int number = 1;; ++number) {
    std::string beside = numbered("." + name + ".new", number);
    auto file = ::unlinkat(folder, beside.c_str(), 0) == 0 || errno == ENOENT
                    ? makeFile(folder, beside)
                    : systemError();
    if (file) return NewFile{std::move(beside), *std::move(file)};
    struct stat status;
    const bool taken = ::fstatat(folder, beside.c_str(), &status, AT_SYMLINK_NOFOLLOW) == 0;
    if (!taken || number == kMaxNamesBeside) return file.error();
  }
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

base::Result<std::string> readRegularFile(int file, std::size_t maximum) {
  struct stat status;
  if (::fstat(file, &status) != 0) return systemError();
  if (!S_ISREG(status.st_mode)) return notRegular();
  std::string bytes;
  bytes.resize(std::min(maximum, static_cast<std::size_t>(status.st_size)));
  std::size_t filled = 0;
  while (filled < bytes.size()) {
    const ssize_t got =
        ::pread(file, bytes.data() + filled, bytes.size() - filled, static_cast<off_t>(filled));
    if (got < 0 && errno == EINTR) continue;
    if (got < 0) return systemError();
    if (got == 0) break;
    filled += static_cast<std::size_t>(got);
  }
  bytes.resize(filled);
  return bytes;
}

base::Result<std::vector<std::string>> namesInFolder(int folder, std::size_t maximum) {
  // A description of its own, because the place in the listing belongs to the description.
  const int again = ::openat(folder, ".", O_RDONLY | O_DIRECTORY | O_CLOEXEC);
  if (again < 0) return systemError();
  const auto close = [](DIR* listing) { ::closedir(listing); };
  const std::unique_ptr<DIR, decltype(close)> listing(::fdopendir(again), close);
  if (listing == nullptr) {
    ::close(again);
    return systemError(ENOMEM);
  }
  std::vector<std::string> names;
  errno = 0;
  while (const dirent* entry = ::readdir(listing.get())) {
    const std::string_view name = entry->d_name;
    if (name != "." && name != "..") names.emplace_back(name);
    if (names.size() > maximum) return systemError(EOVERFLOW);
    errno = 0;
  }
  if (errno != 0) return systemError();
  std::ranges::sort(names);
  return names;
}

bool isPlainFileName(std::string_view name, std::size_t longest) {
  return !name.empty() && name != "." && name != ".." && name.size() <= longest &&
         name.find('/') == std::string_view::npos && name.find('\0') == std::string_view::npos;
}

std::string shownText(std::string_view text) {
  constexpr std::size_t kMaxShown = 80;
  std::string shown(text.substr(0, kMaxShown));
  std::ranges::replace_if(
      shown, [](unsigned char c) { return c < 0x20 || c == 0x7f; }, '?');
  return text.size() > kMaxShown ? shown + "..." : shown;
}

base::Result<void> writeAll(int file, std::string_view bytes) {
  while (!bytes.empty()) {
    const ssize_t written = ::write(file, bytes.data(), bytes.size());
    if (written < 0 && errno == EINTR) continue;
    if (written < 0) return systemError();
    if (written == 0) return systemError(EIO);
    bytes.remove_prefix(static_cast<std::size_t>(written));
  }
  return {};
}

base::Result<void> refuseLinks(int folder, const std::string& name) {
  return refuseNamed(folder, name, refuseLink);
}

base::Result<FileDescriptor> makeFile(int folder, const std::string& name) {
  const AsOwnerOf owner(folder);
  return opened(
      ::openat(folder, name.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, 0600));
}

base::Result<void> makeFolder(int folder, const std::string& name) {
  const AsOwnerOf owner(folder);
  return checked(::mkdirat(folder, name.c_str(), 0700));
}

namespace {

base::Result<void> replace(int folder, const std::string& name, std::string_view bytes,
                           std::optional<mode_t> mode) {
  if (auto free = refuseNamed(folder, name, refuseOtherKinds); !free) return free;
  const auto beside = makeBeside(folder, name);
  if (!beside) return beside.error();
  const int file = beside->file.get();
  const char* from = beside->name.c_str();
  auto replaced =
      writeAll(file, bytes)
          .and_then([&] { return checked(mode ? ::fchmod(file, *mode) : 0); })
          .and_then([&] { return checked(::fsync(file)); })
          .and_then([&] { return checked(::renameat(folder, from, folder, name.c_str())); });
  if (!replaced) {
    ::unlinkat(folder, from, 0);
    return replaced;
  }
  return checked(::fsync(folder));
}

}  // namespace

base::Result<void> replaceFile(int folder, const std::string& name, std::string_view bytes) {
  return replace(folder, name, bytes, std::nullopt);
}

base::Result<void> replaceReadableFile(int folder, const std::string& name,
                                       std::string_view bytes) {
  return replace(folder, name, bytes, 0644);
}

base::Result<void> keepBeside(int folder, const std::string& name, const std::string& kept) {
  for (int number = 1;; ++number) {
    auto renamed =
        checked(::renameat(folder, name.c_str(), folder, numbered(kept, number).c_str()));
    if (renamed || number == kMaxNamesBeside) return renamed;
  }
}

base::Result<void> renameToFreeName(int fromFolder, const std::string& from, int toFolder,
                                    const std::string& to) {
  return checked(::renameat2(fromFolder, from.c_str(), toFolder, to.c_str(), RENAME_NOREPLACE));
}

bool isLink(int folder, const std::string& name) {
  struct stat status;
  return ::fstatat(folder, name.c_str(), &status, AT_SYMLINK_NOFOLLOW) == 0 &&
         S_ISLNK(status.st_mode);
}

base::Result<RolledOver> rollOver(int folder, const std::string& path, const std::string& name,
                                  int oldest) {
  const auto at = [&path](const std::string& file) { return path + "/" + shownText(file); };
  RolledOver rolled;
  std::vector<std::string> places;  // each moves to the next
  bool free = false;
  for (int number = 0; number <= oldest && !free; ++number) {
    const std::string file = number == 0 ? name : name + "." + std::to_string(number);
    struct stat status;
    free = ::fstatat(folder, file.c_str(), &status, AT_SYMLINK_NOFOLLOW) != 0;
    if (free && errno != ENOENT) return systemError().at(at(file));
    if (free || S_ISREG(status.st_mode)) {
      places.push_back(file);
    } else if (number == 0) {
      return notRegular().at(at(file));
    } else {
      rolled.inTheWay.push_back(file);
    }
  }
  if (places.size() == 1 && !free) return notRegular().at(at(rolled.inTheWay.front()));
  for (std::size_t place = places.size() - 1; place > 0; --place) {
    const std::string& from = places[place - 1];
    if (::renameat(folder, from.c_str(), folder, places[place].c_str()) != 0) {
      return systemError().at(at(from));
    }
  }
  if (!free) rolled.dropped = places.back();
  return rolled;
}

base::Result<FileDescriptor> openLines(int folder, const std::string& name) {
  const AsOwnerOf owner(folder);
  auto file = opened(
      ::openat(folder, name.c_str(),
               O_RDWR | O_CREAT | O_APPEND | O_NOFOLLOW | O_NONBLOCK | O_NOCTTY | O_CLOEXEC, 0600));
  if (!file) {
    const bool other = file.error().is(std::errc::too_many_symbolic_link_levels) ||
                       file.error().is(std::errc::is_a_directory);
    return other ? notRegular() : file.error();
  }
  struct stat status;
  if (::fstat(file->get(), &status) != 0) return systemError();
  if (const auto free = refuseOtherKinds(status); !free) return free.error();
  return file;
}

base::Result<std::uint64_t> cutUnfinishedLine(int file) {
  struct stat status;
  if (::fstat(file, &status) != 0) return systemError();
  const off_t whole = sizeOfWholeLines(file, status.st_size);
  if (whole != status.st_size && ::ftruncate(file, whole) != 0) return systemError();
  return static_cast<std::uint64_t>(whole);
}

base::Result<void> appendLines(int folder, const std::string& name, std::string_view lines,
                               const LockWait& wait) {
  const auto file = openLines(folder, name);
  if (!file) return file.error();
  const auto lock = FileLock::take(file->get(), wait);
  if (!lock) return lock.error();
  const auto whole = cutUnfinishedLine(file->get());
  if (!whole) return whole.error();
  auto appended = writeAll(file->get(), lines);
  // Where this fails too, the next call removes the unfinished line.
  if (!appended) std::ignore = ::ftruncate(file->get(), static_cast<off_t>(*whole));
  return appended;
}

}  // namespace host
