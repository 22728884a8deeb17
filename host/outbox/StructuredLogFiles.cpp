// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/outbox/StructuredLogFiles.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <limits>
#include <vector>

#include "base/Text.h"
#include "host/files/FileTime.h"
#include "host/files/Files.h"
#include "host/files/SystemError.h"
#include "host/outbox/SpoolFolder.h"
#include "plist/JSON.h"

namespace host {

namespace {

constexpr char kFolder[] = "/var/spool/morvend/structured";
constexpr std::string_view kSuffix = ".jsonl";

// What is larger goes to the spool in parts, of whole lines as far as there are any.
constexpr off_t kMaxPart = off_t{16} << 20;

// What one dump may move: the spool keeps room for the day's other logs.
constexpr off_t kMaxMoved = static_cast<off_t>(SpoolFolder::kMaxBytes) - kMaxPart;

// Where the parts of a file begin, from an offset on.
std::vector<off_t> partsOf(int file, off_t from, off_t size) {
  std::vector<off_t> starts{from};
  while (size - starts.back() > kMaxPart) {
    starts.push_back(lastLineEnd(file, starts.back(), starts.back() + kMaxPart));
  }
  return starts;
}

// Copies a part of a file into the spool.
base::Result<void> submitPart(int file, off_t start, off_t end, const std::string& stem,
                              SpoolFolder& spool) {
  const auto put = [&](const std::string& to) {
    return renameToFreeName(spool.descriptor(), SpoolFolder::kUnfinishedLog, spool.descriptor(),
                            to);
  };
  auto submitted = makeFile(spool.descriptor(), SpoolFolder::kUnfinishedLog)
                       .and_then([&](const FileDescriptor& part) {
                         return copyBytes(file, start, end, part.get()).and_then([&] {
                           return checked(::fsync(part.get()));
                         });
                       })
                       .and_then([&] {
                         return spool.place(stem, std::string(kSuffix),
                                            static_cast<std::uint64_t>(end - start), put);
                       })
                       .and_then([&] { return checked(::fsync(spool.descriptor())); });
  if (!submitted) spool.remove(SpoolFolder::kUnfinishedLog);
  return submitted;
}

// Moves a file from an offset on into the spool, in parts that are numbered in their order: the
// last one first, each in the spool before it leaves the file.
base::Result<void> cutToSpool(int folder, const std::string& name, off_t from,
                              const std::string& stem, SpoolFolder& spool) {
  const auto file = opened(
      ::openat(folder, name.c_str(), O_RDWR | O_NOFOLLOW | O_NONBLOCK | O_NOCTTY | O_CLOEXEC));
  if (!file) return file.error();
  struct stat status;
  if (::fstat(file->get(), &status) != 0) return systemError();
  off_t end = status.st_size;
  const off_t reach = std::max<off_t>(from - kMaxPart, 0);
  const auto starts = partsOf(file->get(), lastLineEnd(file->get(), reach, from), end);
  for (std::size_t part = starts.size(); part > 0; --part) {
    const std::string number = part > 1 ? "-" + std::to_string(part) : "";
    const off_t start = starts[part - 1];
    auto submitted = submitPart(file->get(), start, end, stem + number, spool);
    if (!submitted) return submitted;
    if (::ftruncate(file->get(), start) != 0) return systemError();
    end = start;
  }
  return checked(::unlinkat(folder, name.c_str(), 0));
}

// The bytes of the regular files among these names; more than there can be count as that.
off_t sizeOfAll(int folder, const std::vector<std::string>& names) {
  constexpr off_t kMax = std::numeric_limits<off_t>::max();
  off_t all = 0;
  for (const std::string& name : names) {
    struct stat status;
    if (::fstatat(folder, name.c_str(), &status, AT_SYMLINK_NOFOLLOW) != 0) continue;
    if (S_ISREG(status.st_mode)) all += std::min(status.st_size, kMax - all);
  }
  return all;
}

// The size of a file; 0 where there is none that lines could be appended to.
std::uint64_t sizeOf(int folder, const std::string& name) {
  struct stat status;
  const bool known = ::fstatat(folder, name.c_str(), &status, AT_SYMLINK_NOFOLLOW) == 0;
  return known && S_ISREG(status.st_mode) ? static_cast<std::uint64_t>(status.st_size) : 0;
}

// Moves a file but for its first `dropped` bytes, of which it takes what it drops. `path` is the
// file's for the log.
base::Result<void> moveToSpool(int folder, const std::string& name, const std::string& path,
                               off_t& dropped, SpoolFolder& spool, platform::SystemLog& log) {
  struct stat status;
  if (::fstatat(folder, name.c_str(), &status, AT_SYMLINK_NOFOLLOW) != 0) return systemError();
  if (!S_ISREG(status.st_mode)) return notRegular();
  const std::string stem = "structured-" + name.substr(0, name.size() - kSuffix.size());
  if (dropped > 0 || status.st_size > kMaxPart) {
    if (status.st_nlink > 1) return severalNames();
    const off_t from = std::min<off_t>(dropped, status.st_size);
    dropped -= from;
    log.log(platform::LogLevel::standard, "%s has %lld bytes: %s", path.c_str(),
            static_cast<long long>(status.st_size),
            from == 0 ? "it is cut into parts"
                      : base::format("the first %lld have no room in the spool and are dropped",
                                     static_cast<long long>(from))
                            .c_str());
    if (from == status.st_size) return checked(::unlinkat(folder, name.c_str(), 0));
    return cutToSpool(folder, name, from, stem, spool);
  }
  return spool.place(stem, std::string(kSuffix), static_cast<std::uint64_t>(status.st_size),
                     [&](const std::string& to) {
                       return renameToFreeName(folder, name, spool.descriptor(), to)
                           .and_then([&] { return checked(::fsync(spool.descriptor())); })
                           .and_then([&] { return checked(::fsync(folder)); });
                     });
}

}  // namespace

void StructuredLogFiles::logStructuredData(std::int32_t type, const plist::Dictionary& data) {
  const plist::Date now = clock_.now();
  std::string line;
  plist::appendJSON(line, plist::Dictionary{{"type", type}, {"time", now}, {"data", data}});
  line += '\n';
  const std::string name = fileDay(now.secondsSince1970).append(kSuffix);
  const auto appended = append(name, line);
  if (appended || !said_.insert(appended.error().text).second) return;
  log_.log(platform::LogLevel::error, "Could not write %s: %s; structured logs are dropped",
           root_.hostPath(kFolder, name).c_str(), appended.error().text.c_str());
}

base::Result<void> StructuredLogFiles::append(const std::string& name, std::string_view line) {
  const auto folder = root_.openFolder(kFolder, DeviceRoot::Missing::create);
  if (!folder) return folder.error();
  const std::string now = run_.nameFor(name);
  const std::uint64_t waiting = run_.isOn() ? sizeOf(folder->get(), now) : 0;
  if (sizeOf(folder->get(), name) + waiting + line.size() > kMaxDay) {
    ++dropped_;
    return {};
  }
  return root_.patience()([&] {
    return appendLines(folder->get(), now, line, {log_, root_.hostPath(kFolder, name)});
  });
}

void StructuredLogFiles::sayDropped() {
  if (dropped_ == 0) return;
  log_.log(platform::LogLevel::error,
           "Dropped %zu structured logs: those of a day take at most %llu bytes", dropped_,
           static_cast<unsigned long long>(kMaxDay));
  dropped_ = 0;
}

StructuredLogFiles::~StructuredLogFiles() { sayDropped(); }

base::Result<void> StructuredLogFiles::synchronise() {
  const auto folder = root_.openFolder(kFolder, DeviceRoot::Missing::fails);
  if (!folder) return unlessMissing(folder.error(), root_.hostPath(kFolder));
  return synchronisePending(folder->get()).at(root_.hostPath(kFolder));
}

base::Result<void> StructuredLogFiles::settle(const Leaves& leaves) {
  sayDropped();
  const auto folder = root_.openFolder(kFolder, DeviceRoot::Missing::fails);
  if (!folder) return unlessMissing(folder.error(), root_.hostPath(kFolder));
  return settleLines(folder->get(), leaves,
                     [](const std::string&, std::uint64_t) { return base::Result<void>(); },
                     {log_, root_.hostPath(kFolder)})
      .at(root_.hostPath(kFolder));
}

void StructuredLogFiles::dumpAllOldStructuredDataLogs() {
  const auto folder = root_.openFolder(kFolder, DeviceRoot::Missing::fails);
  if (!folder && isMissing(folder.error())) return;
  auto names = folder ? namesInFolder(folder->get()) : folder.error();
  if (!names) {
    log_.log(platform::LogLevel::error, "Could not read %s: %s", root_.hostPath(kFolder).c_str(),
             names.error().text.c_str());
    return;
  }
  const std::string today = fileDay(clock_.now().secondsSince1970);
  std::erase_if(*names, [&today](const std::string& name) {
    if (!name.ends_with(kSuffix)) return true;
    const auto day = std::string_view(name).substr(0, name.size() - kSuffix.size());
    return !isFileDay(day) || day >= today;
  });
  if (names->empty()) return;
  const auto spool = SpoolFolder::open(root_, log_);
  // Of more than the spool has room for, the oldest goes.
  off_t dropped = std::max<off_t>(sizeOfAll(folder->get(), *names) - kMaxMoved, 0);
  for (const std::string& name : *names) {
    const std::string path = root_.hostPath(kFolder, name);
    const auto moved =
        spool ? moveToSpool(folder->get(), name, path, dropped, **spool, log_) : spool.error();
    if (!moved) {
      log_.log(platform::LogLevel::error, "Could not move %s to %s: %s", path.c_str(),
               root_.hostPath(SpoolFolder::kPath).c_str(), moved.error().text.c_str());
    }
  }
}

}  // namespace host
