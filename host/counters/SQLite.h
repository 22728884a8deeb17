// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// SQLite, thinly: a connection, and the use of one of its prepared statements.
//
// A connection that failed is of no further use: closing it takes back what was not committed.
#pragma once

#include <sqlite3.h>

#include <chrono>
#include <concepts>
#include <cstddef>
#include <cstdint>
#include <deque>
#include <functional>
#include <memory>
#include <span>
#include <string>
#include <string_view>
#include <system_error>
#include <utility>

#include "base/Result.h"

namespace host::sqlite {

// What these errors are: the file is not a sound database; it, or what must stand beside it, can't
// be written; somebody else has locked it, or the system failed, which may pass. Any other is none.
inline constexpr std::errc kDamaged = std::errc::bad_message;
inline constexpr std::errc kUnwritable = std::errc::read_only_file_system;
inline constexpr std::errc kPassing = std::errc::resource_unavailable_try_again;

// How who waits for somebody else's lock passes the time.
using Pause = std::function<void(std::chrono::milliseconds)>;

// One open database with its prepared statements. Every failure comes back as an error with
// SQLite's own words, and as kDamaged or kUnwritable where it is that; nothing is logged here.
class Connection {
 public:
  // readOnly: leaves the file and its log as they are. immutable: reads the file alone, as it
  // stands, and needs nothing beside it.
  enum class Access { readWrite, readOnly, immutable };
  enum class Checkpoint { passive, truncate };

  // Opens an existing file; a link anywhere in its path is refused. The connection distrusts the
  // file: none of its triggers, views and references does anything. It checkpoints only when told
  // to. For one thread.
  // Locks of others are waited for up to a second, in pauses.
  static base::Result<std::unique_ptr<Connection>> open(const std::string& path, Access access,
                                                        const Pause& pause);
  ~Connection();
  Connection(const Connection&) = delete;
  Connection& operator=(const Connection&) = delete;

  // Runs statements that deliver nothing.
  base::Result<void> execute(const char* sql);

  // True when the header of a file that was opened for writing forbids that. Known once something
  // has been read.
  bool headerForbidsWriting() const { return !openedReadOnly_ && readOnly(); }
  bool inTransaction() const { return sqlite3_get_autocommit(database_) == 0; }

  // Pages in the write-ahead log after the last commit on this connection.
  int pagesInLog() const { return pagesInLog_; }
  // Brings the log into the file. `passive` does what it can without waiting for anybody.
  base::Result<void> checkpoint(Checkpoint mode);

  // Lets the end of this connection, if it is the last to the file, remove what stands beside it.
  void leaveNothingBeside();

 private:
  friend class BlobColumn;
  friend class Statement;

  struct Prepared {
    const char* sql;
    sqlite3_stmt* statement;
    bool inUse;
  };

  Connection() = default;
  base::Result<Prepared*> prepare(const char* sql);
  base::Result<void> check(int code) const {
    if (code == SQLITE_OK) return {};
    return error(code);
  }
  base::Error error(int code) const;
  int errorOfFiles() const;
  static int waitForOthers(void* connection, int timesWaited);
  bool readOnly() const { return sqlite3_db_readonly(database_, "main") == 1; }

  sqlite3* database_ = nullptr;
  bool openedReadOnly_ = false;
  std::deque<Prepared> prepared_;
  int pagesInLog_ = 0;
  Pause pause_;
};

// An argument that is bound as data.
struct Blob {
  std::string_view bytes;
};

// A value of a row. The value of another type than it has is not asked for.
class Column {
 public:
  explicit Column(sqlite3_value* value) : value_(value) {}

  bool isInteger() const { return sqlite3_value_type(value_) == SQLITE_INTEGER; }
  bool isReal() const { return sqlite3_value_type(value_) == SQLITE_FLOAT; }
  bool isText() const { return sqlite3_value_type(value_) == SQLITE_TEXT; }
  bool isBlob() const { return sqlite3_value_type(value_) == SQLITE_BLOB; }

  std::int64_t integer() const { return sqlite3_value_int64(value_); }
  double real() const { return sqlite3_value_double(value_); }
  // Of a text or a blob. A text is not copied for the sake of a closing NUL.
  std::string_view bytes() const {
    const void* start = sqlite3_value_blob(value_);
    return {static_cast<const char*>(start), static_cast<std::size_t>(sqlite3_value_bytes(value_))};
  }

 private:
  sqlite3_value* value_;
};

// One use of a prepared statement, reset at the end of its scope. The connection keeps the
// statement for the next use under the address of its text, so that the text must be a constant.
class Statement {
 public:
  // Binds the arguments in order; texts are borrowed for the life of the object. What fails here is
  // the first step's to say.
  template <typename... Arguments>
  Statement(Connection& connection, const char* sql, const Arguments&... arguments)
      : connection_(connection), prepared_(connection.prepare(sql)) {
    if (!prepared_) return;
    statement_ = (*prepared_)->statement;
    int index = 0;
    [[maybe_unused]] const auto add = [&](int code) {
      if (code_ == SQLITE_OK) code_ = code;
    };
    (add(bind(++index, arguments)), ...);
  }
  ~Statement();
  Statement(const Statement&) = delete;
  Statement& operator=(const Statement&) = delete;

  // Whether there is a row; not to be called again after one that says no, or fails.
  base::Result<bool> step() {
    if (!prepared_) return prepared_.error();
    if (code_ == SQLITE_OK) code_ = sqlite3_step(statement_);
    if (code_ != SQLITE_ROW && code_ != SQLITE_DONE) return connection_.error(code_);
    return std::exchange(code_, SQLITE_OK) == SQLITE_ROW;
  }

  // Hands each row to `row`, until it returns false.
  template <typename Row>
  base::Result<void> forEach(Row row) {
    for (;;) {
      const auto more = step();
      if (!more) return more.error();
      if (!*more || !row()) return {};
    }
  }
  base::Result<void> run() {
    return forEach([] { return true; });
  }

  // A column of the current row, from 0; borrowed until the next step.
  Column column(int index) const { return Column(sqlite3_column_value(statement_, index)); }

 private:
  template <std::integral Integer>
  int bind(int index, Integer value) {
    return sqlite3_bind_int64(statement_, index, value);
  }
  int bind(int index, double value) { return sqlite3_bind_double(statement_, index, value); }
  int bind(int index, std::string_view text) {
    return sqlite3_bind_text64(statement_, index, text.empty() ? "" : text.data(), text.size(),
                               SQLITE_STATIC, SQLITE_UTF8);
  }
  int bind(int index, Blob blob) {
    return sqlite3_bind_blob64(statement_, index, blob.bytes.data(), blob.bytes.size(),
                               SQLITE_STATIC);
  }

  Connection& connection_;
  base::Result<Connection::Prepared*> prepared_;
  sqlite3_stmt* statement_ = nullptr;
  int code_ = SQLITE_OK;  // of the binding
};

// Blobs of one column of a table, read where they lie and no further than is asked for.
class BlobColumn {
 public:
  BlobColumn(Connection& connection, const char* table, const char* column)
      : connection_(connection), table_(table), column_(column) {}
  ~BlobColumn() { sqlite3_blob_close(blob_); }
  BlobColumn(const BlobColumn&) = delete;
  BlobColumn& operator=(const BlobColumn&) = delete;

  // Goes to a row that a query has found; the size of its blob. A row without one is a failure.
  base::Result<std::size_t> open(std::int64_t row);

  // Fills the memory from an offset on, within the size.
  base::Result<void> read(std::size_t offset, std::span<char> into);

 private:
  base::Result<void> check(int code) const;

  Connection& connection_;
  const char *table_, *column_;
  sqlite3_blob* blob_ = nullptr;
};

// A transaction; one that is open already is joined. What isn't committed is taken back at the end
// of the scope.
class Transaction {
 public:
  enum class Kind { read, write };

  explicit Transaction(Connection& connection) : connection_(connection) {}
  ~Transaction();
  Transaction(const Transaction&) = delete;
  Transaction& operator=(const Transaction&) = delete;

  base::Result<void> begin(Kind kind);
  base::Result<void> commit();

 private:
  Connection& connection_;
  bool open_ = false;
};

}  // namespace host::sqlite
