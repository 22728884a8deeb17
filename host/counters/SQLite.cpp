// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/counters/SQLite.h"

#include <tuple>

#include "host/files/Patience.h"
#include "host/files/SystemError.h"

namespace host::sqlite {

namespace {

// Pauses, and how many: they come to a second.
constexpr std::chrono::milliseconds kPause(10);
constexpr int kMaxPauses = 100;

// A path as the URI of a file that nothing changes while it is read.
std::string immutableUri(const std::string& path) {
  std::string uri = "file:";
  for (const char c : path) {
    switch (c) {
      case '%':
        uri += "%25";
        break;
      case '?':
        uri += "%3f";
        break;
      case '#':
        uri += "%23";
        break;
      default:
        uri += c;
    }
  }
  return uri + "?immutable=1";
}

std::errc kindOf(int code, int systemNumber) {
  switch (code & 0xff) {
    case SQLITE_BUSY:
    case SQLITE_LOCKED:
    case SQLITE_PROTOCOL:
    case SQLITE_IOERR:
    case SQLITE_FULL:
    case SQLITE_NOMEM:
      return kPassing;
    case SQLITE_CORRUPT:
    case SQLITE_NOTADB:
      return kDamaged;
    case SQLITE_READONLY:
      return kUnwritable;
    case SQLITE_CANTOPEN:
      return mayPass(systemError(systemNumber)) ? kPassing : kUnwritable;
    default:
      return {};
  }
}

}  // namespace

base::Result<std::unique_ptr<Connection>> Connection::open(const std::string& path, Access access,
                                                           const Pause& pause) {
  constexpr int common = SQLITE_OPEN_NOFOLLOW | SQLITE_OPEN_NOMUTEX | SQLITE_OPEN_EXRESCODE;
  std::unique_ptr<Connection> made(new Connection);
  const int code =
      access == Access::immutable
          ? sqlite3_open_v2(immutableUri(path).c_str(), &made->database_,
                            common | SQLITE_OPEN_READONLY | SQLITE_OPEN_URI, nullptr)
          : sqlite3_open_v2(path.c_str(), &made->database_,
                            common | (access == Access::readOnly ? SQLITE_OPEN_READONLY
                                                                 : SQLITE_OPEN_READWRITE),
                            nullptr);
  if (code != SQLITE_OK) return made->error(code);
  made->openedReadOnly_ = made->readOnly();
  made->pause_ = pause;
  sqlite3_busy_handler(made->database_, waitForOthers, made.get());
  sqlite3_db_config(made->database_, SQLITE_DBCONFIG_DEFENSIVE, 1, nullptr);
  sqlite3_db_config(made->database_, SQLITE_DBCONFIG_TRUSTED_SCHEMA, 0, nullptr);
  // Nothing that the file brings along runs.
  for (const int foreign :
       {SQLITE_DBCONFIG_ENABLE_TRIGGER, SQLITE_DBCONFIG_ENABLE_VIEW, SQLITE_DBCONFIG_ENABLE_FKEY}) {
    sqlite3_db_config(made->database_, foreign, 0, nullptr);
  }
  sqlite3_db_config(made->database_, SQLITE_DBCONFIG_NO_CKPT_ON_CLOSE, 1, nullptr);
  // Takes the place of the automatic checkpoint.
  sqlite3_wal_hook(
      made->database_,
      [](void* connection, sqlite3*, const char*, int pages) {
        static_cast<Connection*>(connection)->pagesInLog_ = pages;
        return SQLITE_OK;
      },
      made.get());
  const auto set = made->execute(
      "PRAGMA cell_size_check = ON; PRAGMA mmap_size = 0; PRAGMA synchronous = NORMAL");
  if (!set) return set.error();
  return made;
}

Connection::~Connection() {
  for (const Prepared& prepared : prepared_) sqlite3_finalize(prepared.statement);
  sqlite3_close(database_);
}

int Connection::waitForOthers(void* connection, int timesWaited) {
  if (timesWaited >= kMaxPauses) return 0;
  static_cast<Connection*>(connection)->pause_(kPause);
  return 1;
}

base::Error Connection::error(int code) const {
  const std::errc kind = kindOf(code, sqlite3_system_errno(database_));
  // SQLite reports a disk that fails to read as a damaged database.
  if (const int number = kind == kDamaged ? errorOfFiles() : 0; number != 0) {
    return {systemError(number).text, kPassing};
  }
  const bool explained = database_ != nullptr && sqlite3_errcode(database_) != SQLITE_OK;
  return {explained ? sqlite3_errmsg(database_) : sqlite3_errstr(code), kind};
}

// The last error number of a system call on the database file or its log, or 0.
int Connection::errorOfFiles() const {
  for (const int which : {SQLITE_FCNTL_FILE_POINTER, SQLITE_FCNTL_JOURNAL_POINTER}) {
    sqlite3_file* file = nullptr;
    sqlite3_file_control(database_, "main", which, &file);
    if (file == nullptr || file->pMethods == nullptr) continue;
    int error = 0;
    file->pMethods->xFileControl(file, SQLITE_FCNTL_LAST_ERRNO, &error);
    if (error != 0) return error;
  }
  return 0;
}

base::Result<void> Connection::execute(const char* sql) {
  return check(sqlite3_exec(database_, sql, nullptr, nullptr, nullptr));
}

base::Result<void> Connection::checkpoint(Checkpoint mode) {
  const bool truncate = mode == Checkpoint::truncate;
  return check(sqlite3_wal_checkpoint_v2(
      database_, "main", truncate ? SQLITE_CHECKPOINT_TRUNCATE : SQLITE_CHECKPOINT_PASSIVE, nullptr,
      nullptr));
}

void Connection::leaveNothingBeside() {
  sqlite3_db_config(database_, SQLITE_DBCONFIG_NO_CKPT_ON_CLOSE, 0, nullptr);
}

base::Result<Connection::Prepared*> Connection::prepare(const char* sql) {
  for (Prepared& prepared : prepared_) {
    if (prepared.sql == sql && !prepared.inUse) {
      prepared.inUse = true;
      return &prepared;
    }
  }
  sqlite3_stmt* statement = nullptr;
  const int code =
      sqlite3_prepare_v3(database_, sql, -1, SQLITE_PREPARE_PERSISTENT, &statement, nullptr);
  if (code != SQLITE_OK) return error(code);
  return &prepared_.emplace_back(Prepared{sql, statement, true});
}

Statement::~Statement() {
  if (!prepared_) return;
  sqlite3_reset(statement_);
  (*prepared_)->inUse = false;
}

base::Result<std::size_t> BlobColumn::open(std::int64_t row) {
  const int code = blob_ != nullptr ? sqlite3_blob_reopen(blob_, row)
                                    : sqlite3_blob_open(connection_.database_, "main", table_,
                                                        column_, row, 0, &blob_);
  if (auto opened = check(code); !opened) return opened.error();
  return static_cast<std::size_t>(sqlite3_blob_bytes(blob_));
}

base::Result<void> BlobColumn::read(std::size_t offset, std::span<char> into) {
  return check(sqlite3_blob_read(blob_, into.data(), static_cast<int>(into.size()),
                                 static_cast<int>(offset)));
}

base::Result<void> BlobColumn::check(int code) const {
  // The index names a row that isn't there, or holds something else.
  if (code == SQLITE_ERROR) return base::Error{sqlite3_errmsg(connection_.database_), kDamaged};
  return connection_.check(code);
}

Transaction::~Transaction() {
  if (open_ && connection_.inTransaction()) std::ignore = connection_.execute("ROLLBACK");
}

base::Result<void> Transaction::begin(Kind kind) {
  if (connection_.inTransaction()) return {};
  auto begun = connection_.execute(kind == Kind::read ? "BEGIN" : "BEGIN IMMEDIATE");
  open_ = static_cast<bool>(begun);
  return begun;
}

base::Result<void> Transaction::commit() {
  if (!open_) return {};
  return connection_.execute("COMMIT");
}

}  // namespace host::sqlite
