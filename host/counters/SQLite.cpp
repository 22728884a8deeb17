#include "host/counters/SQLite.h"

#include <cstring>

namespace host::sqlite {

namespace {

constexpr int kBusyMilliseconds = 5000;

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

Failure::Kind kindOf(int code) {
  switch (code & 0xff) {
    case SQLITE_CORRUPT:
    case SQLITE_NOTADB:
      return Failure::Kind::damaged;
    case SQLITE_READONLY:
    case SQLITE_CANTOPEN:
      return Failure::Kind::unwritable;
    default:
      return Failure::Kind::other;
  }
}

}  // namespace

Connection::Connection(const std::string& path, Access access) {
  constexpr int common = SQLITE_OPEN_NOFOLLOW | SQLITE_OPEN_NOMUTEX | SQLITE_OPEN_EXRESCODE;
  check(access == Access::immutable
            ? sqlite3_open_v2(immutableUri(path).c_str(), &database_,
                              common | SQLITE_OPEN_READONLY | SQLITE_OPEN_URI, nullptr)
            : sqlite3_open_v2(path.c_str(), &database_,
                              common | (access == Access::readOnly ? SQLITE_OPEN_READONLY
                                                                   : SQLITE_OPEN_READWRITE),
                              nullptr));
  if (failure_) return;
  openedReadOnly_ = readOnly();
  sqlite3_busy_timeout(database_, kBusyMilliseconds);
  sqlite3_db_config(database_, SQLITE_DBCONFIG_DEFENSIVE, 1, nullptr);
  sqlite3_db_config(database_, SQLITE_DBCONFIG_TRUSTED_SCHEMA, 0, nullptr);
  sqlite3_db_config(database_, SQLITE_DBCONFIG_NO_CKPT_ON_CLOSE, 1, nullptr);
  // Takes the place of the automatic checkpoint.
  sqlite3_wal_hook(
      database_,
      [](void* connection, sqlite3*, const char*, int pages) {
        static_cast<Connection*>(connection)->pagesInLog_ = pages;
        return SQLITE_OK;
      },
      this);
  execute("PRAGMA cell_size_check = ON; PRAGMA mmap_size = 0; PRAGMA synchronous = NORMAL");
}

Connection::~Connection() {
  for (const Prepared& prepared : prepared_) sqlite3_finalize(prepared.statement);
  sqlite3_close(database_);
}

void Connection::fail(Failure::Kind kind, std::string text) {
  if (!failure_) failure_ = {kind, std::move(text)};
}

void Connection::failWithCode(int code) {
  const Failure::Kind kind = kindOf(code);
  const bool explained = database_ != nullptr && sqlite3_errcode(database_) != SQLITE_OK;
  std::string text = explained ? sqlite3_errmsg(database_) : sqlite3_errstr(code);
  // SQLite reports a disk that fails to read as a damaged database.
  if (const int error = kind == Failure::Kind::damaged ? errorOfFiles() : 0; error != 0) {
    fail(Failure::Kind::other, std::strerror(error));
  } else {
    fail(kind, std::move(text));
  }
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

void Connection::execute(const char* sql) {
  if (!failure_) check(sqlite3_exec(database_, sql, nullptr, nullptr, nullptr));
}

void Connection::checkpoint(Checkpoint mode) {
  if (failure_) return;
  const bool truncate = mode == Checkpoint::truncate;
  check(sqlite3_wal_checkpoint_v2(database_, "main",
                                  truncate ? SQLITE_CHECKPOINT_TRUNCATE : SQLITE_CHECKPOINT_PASSIVE,
                                  nullptr, nullptr));
}

void Connection::leaveNothingBeside() {
  sqlite3_db_config(database_, SQLITE_DBCONFIG_NO_CKPT_ON_CLOSE, 0, nullptr);
}

Connection::Prepared* Connection::prepare(const char* sql) {
  if (failure_) return nullptr;
  for (Prepared& prepared : prepared_) {
    if (prepared.sql == sql && !prepared.inUse) {
      prepared.inUse = true;
      return &prepared;
    }
  }
  sqlite3_stmt* statement = nullptr;
  check(sqlite3_prepare_v3(database_, sql, -1, SQLITE_PREPARE_PERSISTENT, &statement, nullptr));
  if (statement == nullptr) return nullptr;
  return &prepared_.emplace_back(Prepared{sql, statement, true});
}

Statement::~Statement() {
  if (prepared_ == nullptr) return;
  sqlite3_reset(statement_);
  prepared_->inUse = false;
}

std::size_t BlobColumn::open(std::int64_t row) {
  if (connection_.failure()) return 0;
  const int code = blob_ != nullptr ? sqlite3_blob_reopen(blob_, row)
                                    : sqlite3_blob_open(connection_.database_, "main", table_,
                                                        column_, row, 0, &blob_);
  return check(code) ? static_cast<std::size_t>(sqlite3_blob_bytes(blob_)) : 0;
}

bool BlobColumn::read(std::size_t offset, std::span<char> into) {
  return !connection_.failure() &&
         check(sqlite3_blob_read(blob_, into.data(), static_cast<int>(into.size()),
                                 static_cast<int>(offset)));
}

bool BlobColumn::check(int code) {
  if (code == SQLITE_ERROR) {
    // The index names a row that isn't there, or holds something else.
    connection_.fail(Failure::Kind::damaged, sqlite3_errmsg(connection_.database_));
  } else {
    connection_.check(code);
  }
  return code == SQLITE_OK;
}

Transaction::Transaction(Connection& connection, Kind kind)
    : connection_(connection), open_(!connection.failure() && !connection.inTransaction()) {
  if (open_) connection_.execute(kind == Kind::read ? "BEGIN" : "BEGIN IMMEDIATE");
}

Transaction::~Transaction() {
  if (open_ && connection_.inTransaction()) connection_.execute("ROLLBACK");
}

void Transaction::commit() {
  if (open_) connection_.execute("COMMIT");
}

}  // namespace host::sqlite
