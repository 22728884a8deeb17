// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/counters/CounterSchema.h"

#include <algorithm>
#include <cstdint>
#include <string_view>

#include "base/Text.h"
#include "host/counters/KeptTexts.h"
#include "host/counters/WaitingChanges.h"

namespace host {

using base::Error;
using base::Result;
using sqlite::Connection;

namespace {

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

}  // namespace

Result<bool> verifySchema(Connection& connection, DatabaseUse use) {
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
  if (use != DatabaseUse::read && connection.headerForbidsWriting()) {
    return Error{"its header forbids writing", sqlite::kDamaged};
  }
  Result<void> ready;
  if (version == 0 && entries == 0) {
    if (use != DatabaseUse::create) return false;
    ready = connection.execute("PRAGMA journal_mode = WAL; BEGIN IMMEDIATE")
                .and_then([&] { return connection.execute(kSchema); })
                .and_then([&] { return connection.execute(kCreation); });
  } else if (version != kVersion || schema != kSchema || foreign) {
    return Error{"its tables are not the store's", sqlite::kDamaged};
  } else if (use != DatabaseUse::read) {
    ready = connection.execute("PRAGMA journal_mode = WAL");
  }
  if (!ready) return ready.error();
  return true;
}

Result<std::vector<std::string>> dropMeddlingIndexes(Connection& connection) {
  std::vector<std::string> names;
  {
    sqlite::Statement added(connection, kAddedIndexes);
    const auto read = added.forEach([&] {
      if (!onlyOrders(added.column(1).bytes())) names.emplace_back(added.column(0).bytes());
      return true;
    });
    if (!read) return read.error();
  }
  for (const std::string& name : names) {
    std::string quoted;
    for (const char c : name) quoted.append(c == '"' ? 2 : 1, c);
    const auto dropped = connection.execute(("DROP INDEX \"" + quoted + "\"").c_str());
    if (!dropped) return dropped.error();
  }
  return names;
}

}  // namespace host
