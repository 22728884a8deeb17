// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/outbox/SpoolFolder.h"

#include <fcntl.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <map>
#include <string_view>
#include <system_error>
#include <tuple>
#include <utility>

#include "host/files/SystemError.h"

namespace host {

namespace {

// A log counts for no more than what makes the folder full, so that no sum overflows.
std::uint64_t counted(const struct stat& status) {
  return std::min(static_cast<std::uint64_t>(status.st_size), SpoolFolder::kMaxBytes + 1);
}

}  // namespace

base::Result<std::unique_ptr<SpoolFolder>> SpoolFolder::open(const DeviceRoot& root,
                                                             platform::SystemLog& log,
                                                             Unlocked unlocked) {
  auto folder = root.openFolder(kPath, DeviceRoot::Missing::create);
  if (!folder) return folder.error();
  auto lock = FileLock::take(folder->get(), {log, root.hostPath(kPath)});
  if (!lock && (unlocked == Unlocked::refused || !lock.error().is(std::errc::timed_out))) {
    return lock.error();
  }
  if (!lock) {
    log.log(platform::LogLevel::error, "%s: %s; logs that wait are written there all the same",
            root.hostPath(kPath).c_str(), lock.error().text.c_str());
  }
  std::unique_ptr<SpoolFolder> spool(
      new SpoolFolder(root, log, *std::move(folder), std::move(lock).orNone()));
  if (const auto known = spool->lookAround(); !known) return known.error();
  return spool;
}

base::Result<void> SpoolFolder::lookAround() {
  for (const char* name : {kUnfinishedLog, kUnfinishedOptions, kUnlockedLog, kUnlockedOptions}) {
    if (!lock_) break;
    // What can't be removed from there is moved out of the way; else who writes there says why.
    if (::unlinkat(folder_.get(), name, 0) == 0 || errno == ENOENT) continue;
    std::ignore = keepBeside(folder_.get(), name, std::string(name) + ".in-the-way");
  }
  auto names = namesInFolder(folder_.get());
  if (!names) return names.error();
  const std::string_view suffix = kOptionsSuffix;
  std::vector<std::pair<std::string, std::uint64_t>> options;  // by the name of their log
  std::map<std::string, Log> logs;
  for (std::string& name : *names) {
    struct stat status;
    const bool regular =
        ::fstatat(folder_.get(), name.c_str(), &status, AT_SYMLINK_NOFOLLOW) == 0 &&
        S_ISREG(status.st_mode);
    if (const auto pending = parsePendingName(name)) {
      names_.insert(pending->name);  // it is to have it
      if (regular) bytes_ += counted(status);
    } else if (regular && name.ends_with(suffix)) {
      options.emplace_back(name.substr(0, name.size() - suffix.size()), counted(status));
    } else if (regular && !name.starts_with('.')) {
      logs.emplace(name, Log{name, status.st_mtim, counted(status)});
    }
    names_.insert(std::move(name));
  }
  // Options stand before their log does: without it, and without one that is to have its name, the
  // run that wrote them was killed.
  for (const auto& [name, bytes] : options) {
    if (const auto log = logs.find(name); log != logs.end()) {
      log->second.bytes += bytes;
    } else if (lock_ && !names_.contains(name)) {
      remove(name + kOptionsSuffix);
    }
  }
  for (auto& [name, log] : logs) {
    bytes_ += log.bytes;
    logs_.push_back(std::move(log));
  }
  // Logs of one moment differ by the number in their names.
  std::ranges::sort(logs_, [](const Log& a, const Log& b) {
    const auto time = [](const Log& log) {
      return std::tie(log.modified.tv_sec, log.modified.tv_nsec);
    };
    return time(a) != time(b) ? time(a) > time(b)
                              : ::strverscmp(a.name.c_str(), b.name.c_str()) > 0;
  });
  return {};
}

bool SpoolFolder::isStructured(const Log& log) { return log.name.starts_with(kStructured); }

bool SpoolFolder::isFree(const std::string& name) const {
  return !names_.contains(name) && !names_.contains(name + kOptionsSuffix);
}

void SpoolFolder::remove(const std::string& name) {
  if (::unlinkat(folder_.get(), name.c_str(), 0) == 0) names_.erase(name);
}

bool SpoolFolder::remove(std::vector<Log>::iterator log, const char* why) {
  const Log oldest = std::move(*log);
  logs_.erase(log);
  bytes_ -= oldest.bytes;
  const std::string path = root_.hostPath(kPath, oldest.name);
  // The log goes first: its options alone are known for a remainder.
  if (::unlinkat(folder_.get(), oldest.name.c_str(), 0) != 0 && errno != ENOENT) {
    log_.log(platform::LogLevel::error, "Could not remove %s: %s", path.c_str(),
             systemError().text.c_str());
    return false;
  }
  names_.erase(oldest.name);
  remove(oldest.name + kOptionsSuffix);
  log_.log(platform::LogLevel::standard, "Removed %s, the oldest log: %s", path.c_str(), why);
  return true;
}

void SpoolFolder::makeRoom(const std::string& stem, std::uint64_t bytes) {
  constexpr char kWhy[] = "the spool is full";
  if (!lock_) return;
  if (stem.starts_with(kStructured)) {
    auto structured = std::ranges::count_if(logs_, isStructured);
    std::uint64_t taken = bytes;
    for (const Log& log : logs_) taken += isStructured(log) ? log.bytes : 0;
    for (auto log = logs_.end(); log != logs_.begin();) {
      if (structured < std::ptrdiff_t{kMaxStructuredLogs} && taken <= kMaxStructuredBytes) break;
      if (!isStructured(*--log)) continue;
      taken -= log->bytes;
      --structured;
      const auto place = log - logs_.begin();
      remove(log, kWhy);
      log = logs_.begin() + place;
    }
  }
  while (!logs_.empty() && (logs_.size() + 1 > kMaxLogs || bytes_ + bytes > kMaxBytes)) {
    remove(logs_.end() - 1, kWhy);
  }
}

bool SpoolFolder::removeOldest() {
  while (lock_ && !logs_.empty()) {
    const auto structured = std::ranges::find_if(logs_.rbegin(), logs_.rend(), isStructured);
    const auto oldest = structured != logs_.rend() ? structured.base() - 1 : logs_.end() - 1;
    if (remove(oldest, "the disk is full")) return true;
  }
  return false;
}

base::Result<void> SpoolFolder::place(const std::string& stem, const std::string& extension,
                                      std::uint64_t bytes, const Put& put) {
  if (bytes > kMaxBytes) return systemError(EFBIG);
  makeRoom(stem, bytes);
  for (int number = 1;; ++number) {
    std::string name = stem;
    if (number > 1) name.append("-").append(std::to_string(number));
    name += extension;
    if (!isFree(name)) continue;
    auto placed = put(name);
    if (!placed && placed.error().is(std::errc::file_exists)) continue;
    if (!placed) return placed;
    names_.insert(name);
    logs_.insert(logs_.begin(), Log{name, {}, bytes});
    bytes_ += bytes;
    return {};
  }
}

// Gives a log that waits its name, its options first: a kill leaves it to be done again.
base::Result<void> SpoolFolder::publish(const std::vector<std::string>& names,
                                        const std::string& waiting, const PendingName& pending) {
  const std::string options = waiting + kOptionsSuffix;
  const auto isThere = [&names](const std::string& name) {
    return std::ranges::binary_search(names, name);
  };
  std::string name = pending.name;
  // A name that somebody else has taken meanwhile is passed over, for both.
  for (int number = 2; isThere(name) || (isThere(options) && isThere(name + kOptionsSuffix));
       ++number) {
    name = pending.name + "-" + std::to_string(number);
  }
  if (isThere(options)) {
    auto named = renameToFreeName(folder_.get(), options, folder_.get(), name + kOptionsSuffix);
    if (!named) return named;
  }
  return renameToFreeName(folder_.get(), waiting, folder_.get(), name);
}

base::Result<void> SpoolFolder::settle(const Leaves& leaves) {
  const auto names = namesInFolder(folder_.get());
  if (!names) return names.error();
  base::Result<void> outcome;
  bool any = false;
  for (const std::string& name : *names) {
    const auto pending = parsePendingName(name);
    if (!pending) continue;
    any = true;
    base::Result<void> done;
    if (!leaves(pending->day)) {
      done = checked(::unlinkat(folder_.get(), name.c_str(), 0));
    } else if (!name.ends_with(kOptionsSuffix)) {
      done = publish(*names, name, *pending);
    }
    if (outcome) outcome = std::move(done);
  }
  if (any && outcome) outcome = checked(::fsync(folder_.get()));
  return outcome;
}

}  // namespace host
