#include "host/counters/CounterDatabase.h"

#include <fcntl.h>
#include <sys/stat.h>

#include <array>
#include <cerrno>
#include <climits>
#include <cstring>

#include "base/Text.h"
#include "host/counters/SQLite.h"
#include "host/files/Files.h"

namespace host {

using sqlite::Connection;
using sqlite::Failure;

namespace {

constexpr char kName[] = "PLDataStore.sqlitedb";
constexpr std::array<const char*, 3> kBeside = {"-wal", "-shm", "-journal"};
constexpr char kAside[] = "PLDataStore.sqlitedb.corrupt";
constexpr char kLogAside[] = "PLDataStore.sqlitedb.corrupt-wal";

constexpr int kMostPagesInLog = 1000;

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
constexpr char kCreation[] = "PRAGMA user_version = 1; COMMIT";

constexpr char kNotRegular[] = "it, or a file beside it, is not a regular file";
constexpr char kShared[] = "it, or a file beside it, is a file with several names";
constexpr char kNoPath[] = "its path can't be read from /proc: ";

// Where an open file or folder lies on the host; empty, with errno set, when nobody can say.
std::string pathOfOpen(int file) {
  std::array<char, PATH_MAX> path;
  const ssize_t length =
      ::readlink(base::format("/proc/self/fd/%d", file).c_str(), path.data(), path.size());
  return length <= 0 ? "" : std::string(path.data(), static_cast<std::size_t>(length));
}

}  // namespace

CounterDatabase::CounterDatabase(const CounterPlace& place, DeviceRoot::Links links)
    : place_(place), links_(links), name_(kName) {}
CounterDatabase::~CounterDatabase() = default;

bool CounterDatabase::read(const Work& work) {
  Failure failure;
  if (!connection_) {
    std::string error;
    if (!openFolder(DeviceRoot::Missing::fails, error)) {
      if (!error.empty()) place_.log.log(platform::LogLevel::error, "%s", error.c_str());
      return error.empty();
    }
    const FileLock lock(folder_.get());
    failure = connect(Use::read);
  }
  if (connection_ && !failure) {
    work(*connection_);
    failure = connection_->failure();
  }
  if (!failure) return true;
  if (failure.kind == Failure::Kind::damaged && !linked_) {
    const FileLock lock(folder_.get());
    setAside(failure.text);
  } else {
    place_.log.log(platform::LogLevel::error, "%s", located(failure.text).c_str());
  }
  connection_.reset();
  return false;
}

std::string CounterDatabase::write(Missing missing, const Work& work) {
  const bool creates = missing == Missing::create;
  std::string error;
  if (!openFolder(creates ? DeviceRoot::Missing::create : DeviceRoot::Missing::fails, error)) {
    return error;
  }
  const FileLock lock(folder_.get());
  for (bool again = false;; again = true) {
    Failure failure = connect(creates ? Use::create : Use::write);
    if (!failure && !connection_) return {};
    if (!failure) {
      work(*connection_);
      failure = connection_->failure();
    }
    const bool written = !failure;
    if (written && connection_->pagesInLog() > kMostPagesInLog) {
      connection_->checkpoint(Connection::Checkpoint::passive);
      failure = connection_->failure();
    }
    if (!failure) return {};
    connection_.reset();
    const bool damaged = failure.kind == Failure::Kind::damaged;
    // What was written is safe in the log, unless that is damaged.
    if (written && !damaged) return {};
    if (damaged) setAside(failure.text);
    if (!damaged || again) return located(failure.text);
  }
}

std::string CounterDatabase::settle() {
  std::string error = write(Missing::skip, [](Connection& connection) {
    connection.checkpoint(Connection::Checkpoint::truncate);
    connection.leaveNothingBeside();
  });
  if (connection_) {
    const FileLock lock(folder_.get());
    connection_.reset();
  }
  return error;
}

// False with an empty error: there is nothing to be opened, and nothing is to be made.
bool CounterDatabase::openFolder(DeviceRoot::Missing missing, std::string& error) {
  if (folder_) return true;
  const bool creates = missing == DeviceRoot::Missing::create;
  const auto home = place_.home();
  const bool reads = links_ == DeviceRoot::Links::followed;
  if (!home) {
    if (creates || reads) error = "there is no home folder for the counters database";
    return false;
  }
  const std::string folder = *home + "/Library/Pelloran";
  folderPath_ = place_.root.hostPath(folder);
  folder_ = place_.root.openFolder(folder, missing);
  if (reads && (folder_ ? isLink(folder_.get(), kName) : errno == ELOOP)) {
    error = follow(folder);
    if (!error.empty()) folder_ = {};
    return error.empty();
  }
  if (folder_) return true;
  // EBADF: there is no device root.
  if (!creates && (errno == ENOENT || errno == EBADF)) return false;
  error = folderPath_ + ": " + errorText(errno);
  return false;
}

// Finds the file that links lead to, in its own folder and under its own name, beside which its log
// lies. Returns the empty text or what went wrong.
std::string CounterDatabase::follow(const std::string& folder) {
  const FileDescriptor file = place_.root.openForStatus(folder + "/" + kName);
  if (!file) {
    return located(errno == ENOENT ? "a link to it leads nowhere within the device root"
                                   : errorText(errno));
  }
  const std::string path = pathOfOpen(file.get());
  const std::size_t slash = path.rfind('/');
  struct stat status;
  if (slash == path.npos || ::fstat(file.get(), &status) != 0) {
    return located(kNoPath + std::string(errorText(errno)));
  }
  name_ = path.substr(slash + 1);
  folder_ = FileDescriptor(
      ::open(path.substr(0, slash + 1).c_str(), O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC));
  if (!folder_) return located(errorText(errno));
  linked_ = true;
  const auto found = identity();
  if (!found) return located(kNotRegular);
  // The path was the machine's; the file is the one that was found below the root.
  const bool same = found->device == status.st_dev && found->inode == status.st_ino;
  return same ? std::string() : located("moved while it was looked for");
}

// The file that bears the database's name now; none, with errno set, when it isn't a regular file.
std::optional<CounterDatabase::Identity> CounterDatabase::identity() const {
  struct stat status;
  if (::fstatat(folder_.get(), name_.c_str(), &status, AT_SYMLINK_NOFOLLOW) != 0) {
    if (errno == ENOENT) return Identity{};
    return std::nullopt;
  }
  if (!S_ISREG(status.st_mode)) {
    errno = EINVAL;
    return std::nullopt;
  }
  return Identity{status.st_dev, status.st_ino, status.st_nlink};
}

std::string CounterDatabase::create() {
  // A new database must not meet what is left of another one.
  for (const char* suffix : kBeside) ::unlinkat(folder_.get(), (name_ + suffix).c_str(), 0);
  const FileDescriptor file(
      ::openat(folder_.get(), kName, O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, 0600));
  return file ? std::string() : std::strerror(errno);
}

// With the lock held: sees to it that the connection is one to the file that is there. Without a
// failure and without a connection there is no database, and none is to be created.
Failure CounterDatabase::connect(Use use) {
  auto now = identity();
  if (now && connection_ && *now == opened_) return {};
  connection_.reset();
  if (!now) return {Failure::Kind::other, kNotRegular};
  bool sharedBeside = false;
  for (const char* suffix : kBeside) {
    struct stat status;
    if (::fstatat(folder_.get(), (name_ + suffix).c_str(), &status, AT_SYMLINK_NOFOLLOW) != 0) {
      continue;
    }
    if (!S_ISREG(status.st_mode)) return {Failure::Kind::other, kNotRegular};
    sharedBeside = sharedBeside || status.st_nlink > 1;
  }
  const bool shared = now->names > 1;
  if (use != Use::read && (shared || sharedBeside)) return {Failure::Kind::other, kShared};
  if (now->inode == 0) {
    if (use != Use::create) return {};
    if (const std::string error = create(); !error.empty()) return {Failure::Kind::other, error};
    now = identity();
    if (!now) return {Failure::Kind::other, kNotRegular};
  }
  opened_ = *now;
  const std::string path = pathOfOpen(folder_.get());
  // SQLite takes a missing path for a temporary database.
  if (path.empty()) {
    return {Failure::Kind::other, kNoPath + std::string(errorText(errno))};
  }
  const auto open = [&](Connection::Access access) {
    connection_ = std::make_unique<Connection>(path + "/" + name_, access);
    // A scan comes to each page once: a cache of many would be memory that is filled and never
    // read.
    if (use == Use::read) connection_->execute("PRAGMA cache_size = -128");
    verify(use);
  };
  std::string aloneBecause = sharedBeside ? kShared : "";
  if (!sharedBeside) {
    open(linked_ || shared ? Connection::Access::readOnly : Connection::Access::readWrite);
    if (use == Use::read && connection_ &&
        connection_->failure().kind == Failure::Kind::unwritable) {
      aloneBecause = connection_->failure().text;
    }
  }
  if (!aloneBecause.empty()) {
    struct stat log;
    if (::fstatat(folder_.get(), (name_ + kBeside[0]).c_str(), &log, AT_SYMLINK_NOFOLLOW) == 0 &&
        log.st_size > 0) {
      place_.log.log(platform::LogLevel::error, "%s",
                     located("it is read without its write-ahead log: " + aloneBecause).c_str());
    }
    open(Connection::Access::immutable);
  }
  return connection_ ? connection_->failure() : Failure{};
}

// Makes sure that what was opened is a database of this store, and makes it one if it is empty.
void CounterDatabase::verify(Use use) {
  Connection& connection = *connection_;
  std::int64_t version = 0;
  std::string schema;
  {
    const sqlite::Transaction transaction(connection, sqlite::Transaction::Kind::read);
    sqlite::Statement userVersion(connection, "PRAGMA user_version");
    if (userVersion.step()) version = userVersion.column(0).integer();
    sqlite::Statement texts(connection,
                            "SELECT sql FROM sqlite_schema WHERE sql IS NOT NULL ORDER BY rowid");
    while (texts.step()) schema.append(texts.column(0).bytes()).append(";");
  }
  if (connection.failure()) return;
  if (version > kVersion) {
    connection.fail(Failure::Kind::other, base::format("made by a newer version of the store (%d)",
                                                       static_cast<int>(version)));
  } else if (use != Use::read && connection.headerForbidsWriting()) {
    connection.fail(Failure::Kind::damaged, "its header forbids writing");
  } else if (version == 0 && schema.empty()) {
    if (use != Use::create) {
      connection_.reset();
      return;
    }
    connection.execute("PRAGMA journal_mode = WAL; BEGIN IMMEDIATE");
    connection.execute(kSchema);
    connection.execute(kCreation);
  } else if (version != kVersion || schema != kSchema) {
    connection.fail(Failure::Kind::damaged, "its tables are not the store's");
  } else if (use != Use::read) {
    connection.execute("PRAGMA journal_mode = WAL");
  }
}

// With the lock held. Does nothing when another process was first.
void CounterDatabase::setAside(const std::string& why) {
  connection_.reset();
  const auto now = identity();
  if (!now || now->inode == 0 || *now != opened_) return;
  // The database goes first: what is left beside no database is removed before a new one is made.
  if (::renameat(folder_.get(), kName, folder_.get(), kAside) != 0) {
    place_.log.log(platform::LogLevel::error, "%s",
                   located(why + "; it can't be set aside: " + std::strerror(errno)).c_str());
    return;
  }
  if (::renameat(folder_.get(), (name_ + kBeside[0]).c_str(), folder_.get(), kLogAside) != 0) {
    ::unlinkat(folder_.get(), kLogAside, 0);
  }
  for (const char* suffix : kBeside) ::unlinkat(folder_.get(), (name_ + suffix).c_str(), 0);
  place_.log.log(platform::LogLevel::error, "%s",
                 located(why + "; it is set aside as " + kAside).c_str());
  place_.foundDamaged();
}

std::string CounterDatabase::located(const std::string& text) const {
  return folderPath_ + "/" + kName + ": " + text;
}

}  // namespace host
