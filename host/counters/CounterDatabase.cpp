// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/counters/CounterDatabase.h"

#include <fcntl.h>
#include <sys/stat.h>

#include <algorithm>
#include <array>
#include <chrono>
#include <climits>
#include <string_view>
#include <tuple>
#include <vector>

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

// Scalars and days are found by (day, key). Samples are appended to `staged`, and a checkpoint
// packs them into data of 12 bytes each. The texts are compared with those of a database that is
// opened: they stand as SQLite keeps them.
constexpr std::int64_t kVersion = 1;
constexpr char kSchema[] =
    "CREATE TABLE scalars(day INTEGER NOT NULL, key TEXT NOT NULL, value INTEGER NOT NULL, "
    "PRIMARY KEY(day, key)) WITHOUT ROWID, STRICT;"
    "CREATE TABLE staged(day INTEGER NOT NULL, key TEXT NOT NULL, seconds INTEGER NOT NULL, "
    "value REAL NOT NULL) STRICT;"
    "CREATE TABLE packed(day INTEGER NOT NULL, key TEXT NOT NULL, samples BLOB NOT NULL) STRICT;"
    "CREATE INDEX packed_by_day ON packed(day, key);";
// What the schema says of those; the names of a column may come in any case.
constexpr char kOwn[] =
    "SELECT sql FROM sqlite_schema WHERE sql IS NOT NULL AND type IN ('table', 'index') AND "
    "lower(name) IN ('scalars', 'staged', 'packed', 'packed_by_day') ORDER BY rowid";
constexpr char kOwnAtTimes[] =
    "SELECT sql FROM sqlite_schema WHERE type <> 'trigger' AND lower(name) IN ('kept', "
    "'waiting_recorded')";
// What somebody added: it is left as it is, but for indexes that have a say in what is written.
constexpr char kAddedIndexes[] =
    "SELECT name, sql FROM sqlite_schema WHERE type = 'index' AND sql IS NOT NULL AND "
    "lower(tbl_name) IN ('scalars', 'staged', 'packed', 'kept', 'waiting_recorded') AND name <> "
    "'packed_by_day'";
constexpr char kCreation[] = "PRAGMA user_version = 1; COMMIT";

const Error kNotRegular{"it, or a file beside it, is not a regular file"};
const Error kShared{"it, or a file beside it, is a file with several names"};
constexpr char kNoPath[] = "its path can't be read from /proc";

// Whether an index, as SQLite keeps its text, does no more than order rows by columns: a unique or
// partial one, and one of an expression, could refuse what is written, or make it costly.
bool onlyOrders(std::string_view sql) {
  constexpr std::string_view kLetters =
      "abcdefghijklmnopqrstuvwxyzABCDEFGHIJKLMNOPQRSTUVWXYZ0123456789_\"`[]";
  const std::size_t list = sql.find('(');
  if (!sql.starts_with("CREATE INDEX ") || list == sql.npos || !sql.ends_with(')')) return false;
  std::string_view columns = sql.substr(list + 1, sql.size() - list - 2);
  for (bool more = true; more;) {
    const std::size_t end = columns.find(',');
    std::string_view column = columns.substr(0, end);
    const auto skipBlanks = [&column] {
      column.remove_prefix(std::min(column.find_first_not_of(" \t\n"), column.size()));
    };
    skipBlanks();
    const std::size_t name = std::min(column.find_first_not_of(kLetters), column.size());
    if (name == 0) return false;
    column.remove_prefix(name);
    skipBlanks();
    while (column.ends_with(' ')) column.remove_suffix(1);
    if (!column.empty() && column != "ASC" && column != "DESC") return false;
    more = end != columns.npos;
    if (more) columns.remove_prefix(end + 1);
  }
  return true;
}

// The text of a table as SQLite keeps it.
std::string asKept(std::string_view sql) {
  constexpr std::string_view kUnlessThere = "IF NOT EXISTS ";
  return std::string(sql).erase(sql.find(kUnlessThere), kUnlessThere.size());
}

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
    if (!damaged || again) return std::move(done).at(path());
  }
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
    const auto set = (*connection)->execute("PRAGMA cache_size = -128");
    if (!set) return set;
  }
  const auto sound = verify(**connection, use);
  if (!sound) return sound.error();
  if (*sound) connection_ = *std::move(connection);
  return {};
}

// Makes sure that what was opened is a database of this store, and makes it one if it is empty;
// false when it isn't to be made.
Result<bool> CounterDatabase::verify(Connection& connection, Use use) {
  std::int64_t version = 0, entries = 0;
  bool foreign = false;
  std::string schema;
  {
    sqlite::Transaction transaction(connection);
    const auto begun = transaction.begin(sqlite::Transaction::Kind::read);
    if (!begun) return begun.error();
    const auto number = [&connection](const char* sql, std::int64_t& value) {
      sqlite::Statement statement(connection, sql);
      return statement.forEach([&] {
        value = statement.column(0).integer();
        return false;
      });
    };
    sqlite::Statement own(connection, kOwn);
    const auto known =
        number("PRAGMA user_version", version)
            .and_then([&] { return number("SELECT count(*) FROM sqlite_schema", entries); })
            .and_then([&] {
              return own.forEach([&] {
                schema.append(own.column(0).bytes()).append(";");
                return true;
              });
            });
    if (!known) return known.error();
    sqlite::Statement atTimes(connection, kOwnAtTimes);
    const auto read = atTimes.forEach([&] {
      const auto sql = atTimes.column(0).bytes();
      foreign = foreign || (sql != asKept(kKeptTable) && sql != asKept(kWaitingTable));
      return true;
    });
    if (!read) return read.error();
  }
  if (version > kVersion) {
    return Error{
        base::format("made by a newer version of the store (%d)", static_cast<int>(version))};
  }
  if (use != Use::read && connection.headerForbidsWriting()) {
    return Error{"its header forbids writing", sqlite::kDamaged};
  }
  Result<void> ready;
  if (version == 0 && entries == 0) {
    if (use != Use::create) return false;
    ready = connection.execute("PRAGMA journal_mode = WAL; BEGIN IMMEDIATE")
                .and_then([&] { return connection.execute(kSchema); })
                .and_then([&] { return connection.execute(kCreation); });
  } else if (version != kVersion || schema != kSchema || foreign) {
    return Error{"its tables are not the store's", sqlite::kDamaged};
  } else if (use != Use::read) {
    ready = connection.execute("PRAGMA journal_mode = WAL").and_then([&] {
      return dropMeddling(connection);
    });
  }
  if (!ready) return ready.error();
  return true;
}

// Drops the indexes that have a say in what is written. Triggers have none: the connection runs
// none.
Result<void> CounterDatabase::dropMeddling(Connection& connection) {
  std::vector<std::string> names;
  sqlite::Statement added(connection, kAddedIndexes);
  auto dropped = added.forEach([&] {
    if (!onlyOrders(added.column(1).bytes())) names.emplace_back(added.column(0).bytes());
    return true;
  });
  for (const std::string& name : names) {
    if (!dropped) break;
    std::string quoted;
    for (const char c : name) quoted.append(c == '"' ? 2 : 1, c);
    dropped = connection.execute(("DROP INDEX \"" + quoted + "\"").c_str());
    if (!dropped) break;
    place_.log.log(platform::LogLevel::error,
                   "%s: the index %s, which has a say in what is written, is dropped",
                   path().c_str(), shownText(name).c_str());
  }
  return dropped;
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
