// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/counters/CounterDatabase.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <chrono>
#include <climits>
#include <tuple>

#include "base/Text.h"
#include "host/counters/KeptTexts.h"
#include "host/counters/SQLite.h"
#include "host/counters/WaitingChanges.h"
#include "host/files/Files.h"
#include "host/files/Patience.h"
#include "host/files/SystemError.h"

namespace host {

using base::Error;
using base::Result;
using sqlite::Connection;

namespace {

constexpr char kName[] = "PLDataStore.sqlitedb";
constexpr std::array<const char*, 3> kBeside = {"-wal", "-shm", "-journal"};
constexpr char kAside[] = "PLDataStore.sqlitedb.corrupt";
constexpr char kLogAside[] = "PLDataStore.sqlitedb.corrupt-wal";

constexpr int kMaxPagesInLog = 1000;

const Error kNotRegular{"it, or a file beside it, is not a regular file"};
const Error kShared{"it, or a file beside it, is a file with several names"};
constexpr char kNoPath[] = "its path can't be read from /proc";

// What is wrong with what stands in the place of a file.
Error ofPlace(const Error& why) { return mayPass(why) ? why : kNotRegular; }

// Where an open file or folder lies on the host.
Result<std::string> pathOfOpen(int file) {
  std::array<char, PATH_MAX> path;
  const ssize_t length =
      ::readlink(base::format("/proc/self/fd/%d", file).c_str(), path.data(), path.size());
  if (length <= 0) return systemError().at(kNoPath);
  return std::string(path.data(), static_cast<std::size_t>(length));
}

}  // namespace

CounterDatabase::CounterDatabase(const CounterPlace& place, DeviceRoot::Links links)
    : place_(place), links_(links), name_(kName) {}
CounterDatabase::~CounterDatabase() = default;

bool CounterDatabase::refusedForNow(const Error& error) {
  return mayPass(error) || error.is(std::errc::timed_out);
}

Result<void> CounterDatabase::patiently(const std::function<Result<void>()>& attempt) {
  auto done = patient_ ? place_.root.patience()(attempt) : attempt();
  patient_ = done || (patient_ && !refusedForNow(done.error()));
  return done;
}

Result<FileLock> CounterDatabase::lock() {
  return FileLock::take(folder_.get(),
                        {place_.log, folderPath_,
                         patient_ ? kMaxLockWait : std::chrono::milliseconds(0), place_.pause});
}

Result<void> CounterDatabase::read(const Work& work) {
  Result<void> done;
  if (!connection_) done = patiently([this] { return connectToRead(); });
  if (done && connection_) done = readOnce(work);
  if (!done && mayPass(done.error())) return Error{done.error().text, sqlite::kPassing};
  return done;
}

Result<void> CounterDatabase::readOnce(const Work& work) {
  const auto done = work(*connection_);
  if (done) return {};
  connection_.reset();
  const auto held = done.error().is(sqlite::kDamaged) ? lock() : done.error();
  return held ? failedToRead(done.error()) : done.error().at(path());
}

Result<void> CounterDatabase::connectToRead() {
  const auto folder = openFolder(DeviceRoot::Missing::fails);
  if (!folder) return folder.error();
  if (!*folder) return {};
  const auto held = lock();
  if (held && !linked_) {
    if (auto waiting = WaitingChanges::open(folder_.get(), folderPath_); waiting && *waiting) {
      // Who may only read shows what was recorded up to now.
      if (connect(Use::create)) std::ignore = recordWaiting(**waiting);
      connection_.reset();
    }
  }
  if (!held) {
    // Its holder may be stopped; it would have to set the database aside just now to do harm.
    place_.log.log(platform::LogLevel::error, "%s: %s; it is read all the same", path().c_str(),
                   held.error().text.c_str());
  }
  const auto connected = connect(Use::read);
  if (connected) return {};
  return held ? failedToRead(connected.error()) : connected.error().at(path());
}

// With the lock held.
Error CounterDatabase::failedToRead(const Error& why) {
  if (!why.is(sqlite::kDamaged) || linked_) return why.at(path());
  return setAside(why).value_or(why.at(path()));
}

Result<void> CounterDatabase::write(Missing missing, const Work& work, Kept kept) {
  return patiently([&] { return writeOnce(missing, work, kept); });
}

Result<void> CounterDatabase::writeOnce(Missing missing, const Work& work, Kept kept) {
  bool creates = missing == Missing::create;
  const auto folder =
      openFolder(creates ? DeviceRoot::Missing::create : DeviceRoot::Missing::fails);
  if (!folder) return folder.error();
  if (!*folder) return {};
  const auto held = lock();
  if (!held) return held.error().at(path());
  auto found = WaitingChanges::open(folder_.get(), folderPath_);
  if (!found && mayPass(found.error())) return found.error().at(path());
  // Something else in the journal's place is a matter of who wants to leave something there.
  auto waiting = found ? *std::move(found) : std::nullopt;
  creates = creates || waiting;
  for (bool again = false;; again = true) {
    auto done = connect(creates ? Use::create : Use::write);
    if (done && !connection_) return {};
    if (done && waiting) {
      done = recordWaiting(*waiting);
      if (done) waiting.reset();
    }
    if (done) done = work(*connection_);
    const bool written = static_cast<bool>(done);
    if (written && kept == Kept::onDisk) {
      if (const auto safe = synchronise(); !safe) {
        return Error{"it is recorded, but a loss of power may take it: " + safe.error().text}.at(
            path());
      }
    }
    if (written && connection_->pagesInLog() > kMaxPagesInLog) {
      done = connection_->checkpoint(Connection::Checkpoint::passive);
    }
    if (done) return {};
    connection_.reset();
    const bool damaged = done.error().is(sqlite::kDamaged);
    // What was written is safe in the log, unless that is damaged.
    if (written && !damaged) return {};
    if (const auto said = damaged ? setAside(done.error()) : std::nullopt) {
      place_.log.log(platform::LogLevel::error, "%s", said->text.c_str());
    }
    if (done.error().is(sqlite::kUnwritable) && mayBeWritten()) {
      return Error{done.error().text, sqlite::kPassing}.at(path());
    }
    if (!damaged || again) return std::move(done).at(path());
  }
}

// SQLite opens for reading what it fails to open for writing, whatever the reason was.
bool CounterDatabase::mayBeWritten() const {
  const auto allowed = [this](const std::string& name) {
    return ::faccessat(folder_.get(), name.c_str(), W_OK, AT_EACCESS) == 0 || errno == ENOENT;
  };
  return allowed(".") && allowed(name_) &&
         std::ranges::all_of(kBeside, [&](const char* suffix) { return allowed(name_ + suffix); });
}

Result<void> CounterDatabase::recordWaiting(WaitingChanges& waiting) {
  return waiting.recordAll(
      *connection_, [this] { return synchronise(); }, place_.log);
}

// Brings to disk what is in the write-ahead log.
Result<void> CounterDatabase::synchronise() {
  const auto log = opened(::openat(folder_.get(), (name_ + kBeside[0]).c_str(),
                                   O_RDONLY | O_NOFOLLOW | O_NONBLOCK | O_NOCTTY | O_CLOEXEC));
  if (!log) return log.error();
  return checked(::fsync(log->get())).and_then([this] { return checked(::fsync(folder_.get())); });
}

Result<void> CounterDatabase::keepWaiting(std::span<const CounterChange> changes) {
  return openFolder(DeviceRoot::Missing::create).and_then([&](bool) {
    return host::keepWaiting(folder_.get(), changes).at(path());
  });
}

Result<void> CounterDatabase::settle() {
  auto settled = write(Missing::skip, [](Connection& connection) {
    return connection.checkpoint(Connection::Checkpoint::truncate).and_then([&] {
      connection.leaveNothingBeside();
      return Result<void>();
    });
  });
  if (!connection_) return settled;
  const auto held = lock();
  if (!held) return held.error().at(path());
  connection_.reset();
  return settled;
}

// False: there is nothing to be opened, and nothing is to be made.
Result<bool> CounterDatabase::openFolder(DeviceRoot::Missing missing) {
  if (folder_) return true;
  const bool creates = missing == DeviceRoot::Missing::create;
  const auto home = place_.home();
  const bool reads = links_ == DeviceRoot::Links::followed;
  if (!home) {
    if (creates || reads) return Error{"there is no home folder for the counters database"};
    return false;
  }
  const std::string folder = *home + "/Library/Pelloran";
  folderPath_ = place_.root.hostPath(folder);
  auto found = place_.root.openFolder(folder, missing);
  const bool led = found ? isLink(found->get(), kName)
                         : found.error().is(std::errc::too_many_symbolic_link_levels);
  if (reads && led) {
    if (const auto followed = follow(folder); !followed) {
      folder_ = {};
      return followed.error().at(path());
    }
    return true;
  }
  if (found) {
    folder_ = *std::move(found);
    return true;
  }
  if (!creates && isMissing(found.error())) return false;
  return found.error().at(folderPath_);
}

// Finds the file that links lead to, in its own folder and under its own name, beside which its log
// lies.
Result<void> CounterDatabase::follow(const std::string& folder) {
  const auto file = place_.root.openForStatus(folder + "/" + kName);
  if (!file && isMissing(file.error())) {
    return Error{"a link to it leads nowhere within the device root"};
  }
  if (!file) return file.error();
  const auto found = pathOfOpen(file->get());
  if (!found) return found.error();
  const std::size_t slash = found->rfind('/');
  struct stat status;
  if (slash == found->npos || ::fstat(file->get(), &status) != 0) {
    return systemError().at(kNoPath);
  }
  name_ = found->substr(slash + 1);
  auto itsFolder = opened(
      ::open(found->substr(0, slash + 1).c_str(), O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC));
  if (!itsFolder) return itsFolder.error();
  folder_ = *std::move(itsFolder);
  linked_ = true;
  const auto now = identity();
  if (!now) return ofPlace(now.error());
  // The path was the machine's; the file is the one that was found below the root.
  const bool same = now->device == status.st_dev && now->inode == status.st_ino;
  if (!same) return Error{"moved while it was looked for"};
  return {};
}

// The file that bears the database's name now; it is a regular one.
Result<CounterDatabase::Identity> CounterDatabase::identity() const {
  struct stat status;
  if (::fstatat(folder_.get(), name_.c_str(), &status, AT_SYMLINK_NOFOLLOW) != 0) {
    if (errno == ENOENT) return Identity{};
    return systemError();
  }
  if (!S_ISREG(status.st_mode)) return notRegular();
  return Identity{status.st_dev, status.st_ino, status.st_nlink};
}

Result<void> CounterDatabase::create() {
  // A new database must not meet what is left of another one.
  for (const char* suffix : kBeside) ::unlinkat(folder_.get(), (name_ + suffix).c_str(), 0);
  const auto file = makeFile(folder_.get(), kName);
  if (!file) return file.error();
  return {};
}

// With the lock held: sees to it that the connection is one to the file that is there. Without a
// failure and without a connection there is no database, and none is to be created.
Result<void> CounterDatabase::connect(Use use) {
  auto now = identity();
  if (now && connection_ && *now == opened_) return {};
  connection_.reset();
  if (!now) return ofPlace(now.error());
  bool sharedBeside = false;
  for (const char* suffix : kBeside) {
    struct stat status;
    if (::fstatat(folder_.get(), (name_ + suffix).c_str(), &status, AT_SYMLINK_NOFOLLOW) != 0) {
      continue;
    }
    if (!S_ISREG(status.st_mode)) return kNotRegular;
    sharedBeside = sharedBeside || status.st_nlink > 1;
  }
  const bool shared = now->names > 1;
  if (use != Use::read && (shared || sharedBeside)) return kShared;
  if (now->inode == 0) {
    if (use != Use::create) return {};
    if (auto created = create(); !created) return created;
    now = identity();
    if (!now) return ofPlace(now.error());
  }
  opened_ = *now;
  // SQLite takes a missing path for a temporary database.
  const auto folder = pathOfOpen(folder_.get());
  if (!folder) return folder.error();
  const std::string path = *folder + "/" + name_;
  using Access = Connection::Access;
  std::string aloneBecause = kShared.text;
  if (!sharedBeside) {
    auto connected = openAs(use, path, linked_ || shared ? Access::readOnly : Access::readWrite);
    if (connected || use != Use::read || !connected.error().is(sqlite::kUnwritable)) {
      return connected;
    }
    aloneBecause = connected.error().text;
  }
  struct stat log;
  if (::fstatat(folder_.get(), (name_ + kBeside[0]).c_str(), &log, AT_SYMLINK_NOFOLLOW) == 0 &&
      log.st_size > 0) {
    place_.log.log(platform::LogLevel::error, "%s: it is read without its write-ahead log: %s",
                   this->path().c_str(), aloneBecause.c_str());
  }
  return openAs(use, path, Access::immutable);
}

Result<void> CounterDatabase::openAs(Use use, const std::string& path, Connection::Access access) {
  auto connection = Connection::open(path, access, place_.pause);
  if (!connection) return connection.error();
  if (use == Use::read) {
    // A scan comes to each page once: a cache of many would be memory that is filled and never
    // read.
    auto set = (*connection)->execute("PRAGMA cache_size = -128");
    if (!set) return set;
  }
  const auto sound = verifySchema(**connection, use);
  if (!sound) return sound.error();
  if (!*sound) return {};
  if (use != Use::read) {
    const auto dropped = dropMeddlingIndexes(**connection);
    if (!dropped) return dropped.error();
    for (const std::string& index : *dropped) {
      place_.log.log(platform::LogLevel::error,
                     "%s: the index %s, which has a say in what is written, is dropped",
                     this->path().c_str(), shownText(index).c_str());
    }
  }
  connection_ = *std::move(connection);
  return {};
}

// With the lock held. What is to be said of it; none when another process was first.
std::optional<Error> CounterDatabase::setAside(const Error& why) {
  connection_.reset();
  const auto now = identity();
  if (!now || now->inode == 0 || *now != opened_) return std::nullopt;
  // The database goes first: what is left beside no database is removed before a new one is made.
  if (::renameat(folder_.get(), kName, folder_.get(), kAside) != 0) {
    return Error{why.text + "; it can't be set aside: " + systemError().text}.at(path());
  }
  if (::renameat(folder_.get(), (name_ + kBeside[0]).c_str(), folder_.get(), kLogAside) != 0) {
    ::unlinkat(folder_.get(), kLogAside, 0);
  }
  for (const char* suffix : kBeside) ::unlinkat(folder_.get(), (name_ + suffix).c_str(), 0);
  place_.foundDamaged();
  return Error{why.text + "; it is set aside as " + kAside}.at(path());
}

std::string CounterDatabase::path() const { return folderPath_ + "/" + kName; }

}  // namespace host
