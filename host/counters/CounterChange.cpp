// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/counters/CounterChange.h"

#include <string>

#include "base/UTF8.h"

namespace host {

base::Result<void> record(sqlite::Connection& connection, const CounterChange& change) {
  std::string room;
  const std::string_view key = base::writable(change.key, room);
  switch (change.kind) {
    case CounterChange::Kind::set:
      return sqlite::Statement(connection,
                               "INSERT INTO scalars(day, key, value) VALUES(?1, ?2, ?3) "
                               "ON CONFLICT(day, key) DO UPDATE SET value = excluded.value",
                               change.day, key, change.amount)
          .run();
    case CounterChange::Kind::add:
      return sqlite::Statement(
                 connection,
                 "INSERT INTO scalars(day, key, value) VALUES(?1, ?2, ?3) "
                 "ON CONFLICT(day, key) DO UPDATE SET value = CASE "
                 "WHEN ?3 > 0 AND value > 9223372036854775807 - ?3 THEN 9223372036854775807 "
                 "WHEN ?3 < 0 AND value < -9223372036854775807 - 1 - ?3 "
                 "THEN -9223372036854775807 - 1 "
                 "ELSE value + ?3 END",
                 change.day, key, change.amount)
          .run();
    case CounterChange::Kind::push:
      return sqlite::Statement(
                 connection, "INSERT INTO staged(day, key, seconds, value) VALUES(?1, ?2, ?3, ?4)",
                 change.day, key, change.seconds, change.sample)
          .run();
  }
  return {};
}

}  // namespace host
