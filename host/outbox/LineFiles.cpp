// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/outbox/LineFiles.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <charconv>
#include <cstdint>
#include <string_view>
#include <system_error>
#include <utility>

#include "host/files/Files.h"
#include "host/files/SystemError.h"

namespace host {

namespace {

using Block = std::array<char, 65536>;

// Lines that are being appended have this name until all are: ".publishing-<offset>.<name>", where
// the offset is the size that the file had before.
constexpr std::string_view kPublishing = ".publishing-";

struct Begun {
  off_t offset;
  std::string name;
};

std::optional<Begun> parseBegun(std::string_view fileName) {
  if (!fileName.starts_with(kPublishing)) return std::nullopt;
  fileName.remove_prefix(kPublishing.size());
  const auto dot = fileName.find('.');
  if (dot == fileName.npos || dot + 1 == fileName.size()) return std::nullopt;
  Begun begun{0, std::string(fileName.substr(dot + 1))};
  const char* const end = fileName.data() + dot;
  const auto parsed = std::from_chars(fileName.data(), end, begun.offset);
  if (parsed.ec != std::errc{} || parsed.ptr != end || begun.offset < 0) return std::nullopt;
  return begun;
}

base::Result<FileDescriptor> openWaiting(int folder, const std::string& name) {
  auto file = opened(
      ::openat(folder, name.c_str(), O_RDONLY | O_NOFOLLOW | O_NONBLOCK | O_NOCTTY | O_CLOEXEC));
  if (!file) return file;
  struct stat status;
  if (::fstat(file->get(), &status) != 0) return systemError();
  if (!S_ISREG(status.st_mode)) return notRegular();
  return file;
}

// How many bytes of one file stand in another from an offset on.
off_t commonBytes(int file, off_t size, int other, off_t offset) {
  Block here, there;
  off_t common = 0;
  while (common < size) {
    const auto wanted = static_cast<std::size_t>(std::min<off_t>(size - common, here.size()));
    const ssize_t got = ::pread(file, here.data(), wanted, common);
    if (got <= 0) break;
    const ssize_t found =
        ::pread(other, there.data(), static_cast<std::size_t>(got), offset + common);
    if (found <= 0) break;
    const auto end = std::mismatch(here.begin(), here.begin() + found, there.begin()).first;
    common += end - here.begin();
    if (end != here.begin() + found) break;
  }
  return common;
}

// How many of the first bytes of a file are whole lines.
off_t wholeLines(int file, off_t bytes) {
  const off_t end = lastLineEnd(file, 0, bytes);
  char last = 0;
  return ::pread(file, &last, 1, end - 1) == 1 && last == '\n' ? end : 0;
}

// The file that lines are for, locked, without an unfinished line; where it ends.
struct Target {
  FileDescriptor file;
  FileLock lock;
  off_t end;
};

base::Result<Target> openTarget(int folder, const std::string& name, const LockWait& wait) {
  auto file = openLines(folder, name);
  if (!file) return file.error();
  auto lock = FileLock::take(file->get(), wait);
  if (!lock) return lock.error();
  const auto end = cutUnfinishedLine(file->get());
  if (!end) return end.error();
  return Target{*std::move(file), *std::move(lock), static_cast<off_t>(*end)};
}

// Appends what isn't there yet of lines whose appending has begun, and removes their own file.
base::Result<void> finish(int folder, const std::string& waiting, const Begun& begun,
                          const Target& target) {
  const auto from = openWaiting(folder, waiting);
  if (!from) return from.error();
  struct stat status;
  if (::fstat(from->get(), &status) != 0) return systemError();
  const int to = target.file.get();
  const off_t common = commonBytes(from->get(), status.st_size, to, begun.offset);
  return copyBytes(from->get(), wholeLines(from->get(), common), status.st_size, to)
      .and_then([&] { return checked(::fsync(to)); })
      .and_then([&] { return checked(::unlinkat(folder, waiting.c_str(), 0)); });
}

base::Result<void> publish(int folder, const std::string& waiting, const std::string& name,
                           const MakeRoom& makeRoom, const LockWait& wait) {
  struct stat status;
  if (::fstatat(folder, waiting.c_str(), &status, AT_SYMLINK_NOFOLLOW) != 0) return systemError();
  if (!S_ISREG(status.st_mode)) return notRegular();
  if (auto room = makeRoom(name, static_cast<std::uint64_t>(status.st_size)); !room) return room;
  // Where the file isn't there yet, the lines are it.
  auto named = renameToFreeName(folder, waiting, folder, name);
  if (named || !named.error().is(std::errc::file_exists)) return named;
  const auto target = openTarget(folder, name, wait);
  if (!target) return target.error();
  const Begun begun{target->end, name};
  const std::string publishing =
      std::string(kPublishing) + std::to_string(begun.offset) + "." + name;
  if (auto renamed = renameToFreeName(folder, waiting, folder, publishing); !renamed) {
    return renamed;
  }
  return finish(folder, publishing, begun, *target);
}

}  // namespace

off_t lastLineEnd(int file, off_t from, off_t to) {
  Block block;
  for (off_t end = to; end > from;) {
    const off_t start = std::max<off_t>(end - off_t{block.size()}, from);
    const auto wanted = static_cast<std::size_t>(end - start);
    const ssize_t got = ::pread(file, block.data(), wanted, start);
    if (got <= 0) break;
    const std::string_view read(block.data(), static_cast<std::size_t>(got));
    if (const auto at = read.rfind('\n'); at != read.npos) return start + off_t(at) + 1;
    end = start;
  }
  return to;
}

base::Result<void> copyBytes(int from, off_t start, off_t end, int to) {
  Block block;
  while (start < end) {
    const auto wanted = static_cast<std::size_t>(std::min<off_t>(end - start, block.size()));
    const ssize_t got = ::pread(from, block.data(), wanted, start);
    if (got < 0) return systemError();
    if (got == 0) return systemError(EIO);
    auto written = writeAll(to, {block.data(), static_cast<std::size_t>(got)});
    if (!written) return written;
    start += got;
  }
  return {};
}

base::Result<void> synchronisePending(int folder) {
  const auto names = namesInFolder(folder);
  if (!names) return names.error();
  bool any = false;
  for (const std::string& name : *names) {
    if (!parsePendingName(name)) continue;
    any = true;
    auto done = openWaiting(folder, name).and_then([](const FileDescriptor& file) {
      return checked(::fsync(file.get()));
    });
    if (!done) return done;
  }
  return any ? checked(::fsync(folder)) : base::Result<void>();
}

base::Result<void> settleLines(int folder, const Leaves& leaves, const MakeRoom& makeRoom,
                               const LockWait& wait) {
  const auto names = namesInFolder(folder);
  if (!names) return names.error();
  base::Result<void> outcome;
  const auto note = [&outcome](base::Result<void> done) {
    if (outcome) outcome = std::move(done);
  };
  for (const std::string& name : *names) {
    if (const auto begun = parseBegun(name)) {
      note(openTarget(folder, begun->name, wait).and_then([&](const Target& target) {
        return finish(folder, name, *begun, target);
      }));
    } else if (const auto pending = parsePendingName(name)) {
      note(leaves(pending->day) ? publish(folder, name, pending->name, makeRoom, wait)
                                : checked(::unlinkat(folder, name.c_str(), 0)));
    }
  }
  return outcome;
}

}  // namespace host
