// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/counters/CounterStore.h"

#include <array>
#include <cmath>
#include <functional>
#include <optional>
#include <vector>

#include "base/ByteWriter.h"
#include "base/CivilDate.h"
#include "host/counters/KeptTexts.h"
#include "host/counters/SQLite.h"

namespace host {

namespace {

constexpr int kDaysKept = 60;
constexpr std::size_t kMaxSamplesInRow = 65536;

// Moves the staged samples behind those that are packed already.
base::Result<void> pack(sqlite::Connection& connection) {
  std::int64_t day = 0;
  std::string key, samples;
  const auto flush = [&]() -> base::Result<void> {
    if (samples.empty()) return {};
    auto written =
        sqlite::Statement(connection, "INSERT INTO packed(day, key, samples) VALUES(?, ?, ?)", day,
                          key, sqlite::Blob{samples})
            .run();
    samples.clear();
    return written;
  };
  base::Result<void> flushed;
  bool any = false;
  sqlite::Statement staged(connection,
                           "SELECT day, key, seconds, value FROM staged ORDER BY day, key, rowid");
  auto read = staged.forEach([&] {
    any = true;
    const sqlite::Column itsDay = staged.column(0), itsKey = staged.column(1);
    const sqlite::Column second = staged.column(2), value = staged.column(3);
    if (!itsDay.isInteger() || !itsKey.isText() || !second.isInteger() || !value.isReal()) {
      return true;
    }
    if (day != itsDay.integer() || key != itsKey.bytes() ||
        samples.size() == kMaxSamplesInRow * kPackedSampleSize) {
      flushed = flush();
      day = itsDay.integer();
      key = itsKey.bytes();
    }
    base::appendLittleEndian(samples, value.real());
    base::appendLittleEndian(samples, static_cast<std::int32_t>(second.integer()));
    return static_cast<bool>(flushed);
  });
  if (!read) return read;
  if (flushed) flushed = flush();
  // A day without new samples writes nothing.
  if (!flushed || !any) return flushed;
  return sqlite::Statement(connection, "DELETE FROM staged").run();
}

// Samples are packed before this, so that none is staged. Each step back is one seek in each table.
// Days after today, of a clock that was wrong or of an import, are neither counted nor dropped.
base::Result<void> dropOldDays(sqlite::Connection& connection, std::int32_t today) {
  std::int64_t oldest = std::int64_t{today} + 1;
  for (int kept = 0; kept < kDaysKept; ++kept) {
    sqlite::Statement before(connection,
                             "SELECT max(day) FROM ("
                             "SELECT max(day) AS day FROM scalars WHERE day < ?1 UNION ALL "
                             "SELECT max(day) FROM packed WHERE day < ?1)",
                             oldest);
    const auto found = before.step();
    if (!found) return found.error();
    if (!*found || !before.column(0).isInteger()) return {};
    oldest = before.column(0).integer();
  }
  return sqlite::Statement(connection, "DELETE FROM scalars WHERE day < ?", oldest)
      .run()
      .and_then([&] {
        return sqlite::Statement(connection, "DELETE FROM packed WHERE day < ?", oldest).run();
      });
}

// Runs the work in a transaction for writing.
base::Result<void> inTransaction(sqlite::Connection& connection,
                                 const std::function<base::Result<void>()>& work) {
  sqlite::Transaction transaction(connection);
  return transaction.begin(sqlite::Transaction::Kind::write).and_then(work).and_then([&] {
    return transaction.commit();
  });
}

}  // namespace

CounterStore::CounterStore(const DeviceRoot& root, platform::Clock& clock, platform::SystemLog& log,
                           std::function<std::optional<std::string>()> home,
                           std::function<void()> foundDamaged, sqlite::Pause pause)
    : place_{root, log, std::move(home), std::move(foundDamaged), std::move(pause)},
      clock_(clock),
      database_(place_, DeviceRoot::Links::refused) {}

std::int32_t CounterStore::PLDaysSince1970() {
  return base::dayNumber(clock_.now().secondsSince1970);
}

plist::Date CounterStore::PLDateFromDaysSince1970(std::int32_t day) {
  return {static_cast<double>(day) * static_cast<double>(base::kSecondsPerDay)};
}

void CounterStore::PLClientSetValueForScalarKey(std::string_view key, std::int64_t value) {
  record(CounterChange::Kind::set, std::array{platform::ScalarValue{key, value}});
}

void CounterStore::PLClientAddValueForScalarKey(std::string_view key, std::int64_t value) {
  record(CounterChange::Kind::add, std::array{platform::ScalarValue{key, value}});
}

void CounterStore::PLClientSetValuesForScalarKeys(std::span<const platform::ScalarValue> values) {
  record(CounterChange::Kind::set, values);
}

void CounterStore::PLClientAddValuesForScalarKeys(std::span<const platform::ScalarValue> values) {
  record(CounterChange::Kind::add, values);
}

void CounterStore::record(CounterChange::Kind kind, std::span<const platform::ScalarValue> values) {
  if (values.empty()) return;
  const std::int32_t today = PLDaysSince1970();
  std::vector<CounterChange> changes;
  changes.reserve(values.size());
  for (const auto& [key, value] : values) {
    changes.push_back({.kind = kind, .key = key, .day = today, .amount = value});
  }
  noted(apply(changes));
}

// Says why values couldn't be recorded, and keeps it.
bool CounterStore::noted(base::Result<void> applied) {
  const std::scoped_lock lock(mutex_);
  if (!applied && (lastRecord_ || applied.error().text != lastRecord_.error().text)) {
    place_.log.log(platform::LogLevel::error, "Could not record counters: %s",
                   applied.error().text.c_str());
  }
  if (recorded_) recorded_ = applied;
  lastRecord_ = std::move(applied);
  return static_cast<bool>(lastRecord_);
}

bool CounterStore::addValuesAndKeep(std::span<const platform::ScalarValue> values,
                                    std::string_view name, std::string_view text) {
  const std::int32_t today = PLDaysSince1970();
  const auto addAndKeep = [&](sqlite::Connection& connection) -> base::Result<void> {
    for (const auto& [key, value] : values) {
      const CounterChange change{
          .kind = CounterChange::Kind::add, .key = key, .day = today, .amount = value};
      if (auto written = host::record(connection, change); !written) return written;
    }
    return keepText(connection, name, text);
  };
  std::unique_lock lock(mutex_);
  auto done =
      database_.write(CounterDatabase::Missing::create, [&](sqlite::Connection& connection) {
        return inTransaction(connection, [&] { return addAndKeep(connection); });
      });
  lock.unlock();
  return noted(std::move(done));
}

base::Result<std::string> CounterStore::keptText(std::string_view name) {
  base::Result<std::string> text = std::string();
  const std::scoped_lock lock(mutex_);
  const auto read =
      database_.write(CounterDatabase::Missing::skip, [&](sqlite::Connection& connection) {
        text = host::keptText(connection, name);
        return text ? base::Result<void>() : text.error();
      });
  if (!read) return read.error();
  return text;
}

base::Result<void> CounterStore::recorded() {
  const std::scoped_lock lock(mutex_);
  return recorded_;
}

void CounterStore::PLClientCheckpoint() {
  const std::int32_t today = PLDaysSince1970();
  const std::scoped_lock lock(mutex_);
  const auto packed =
      database_.write(CounterDatabase::Missing::skip, [today](sqlite::Connection& connection) {
        return inTransaction(connection,
                             [&] {
                               return pack(connection).and_then([&] {
                                 return dropOldDays(connection, today);
                               });
                             })
            .and_then(
                [&] { return connection.checkpoint(sqlite::Connection::Checkpoint::truncate); });
      });
  if (!packed) {
    place_.log.log(platform::LogLevel::error, "%s", packed.error().text.c_str());
  }
}

base::Result<void> CounterStore::settle() {
  const std::scoped_lock lock(mutex_);
  return database_.settle();
}

base::Result<void> CounterStore::applyAndKeep(
    std::string_view name, const std::function<base::Result<Step>(const std::string&)>& step) {
  const auto stepAndKeep = [&](sqlite::Connection& connection) -> base::Result<void> {
    const auto kept = host::keptText(connection, name);
    if (!kept) return kept.error();
    const auto next = step(*kept);
    if (!next) return next.error();
    for (const CounterChange& change : next->changes) {
      if (auto written = host::record(connection, change); !written) return written;
    }
    return keepText(connection, name, next->text);
  };
  const std::scoped_lock lock(mutex_);
  return database_.write(CounterDatabase::Missing::create, [&](sqlite::Connection& connection) {
    return inTransaction(connection, [&] { return stepAndKeep(connection); });
  });
}

base::Result<void> CounterStore::apply(std::span<const CounterChange> changes, Kept kept) {
  for (const CounterChange& change : changes) {
    if (std::isnan(change.sample)) {
      return base::Error{"not a number can't be recorded as a sample"};
    }
  }
  const auto writeAll = [changes](sqlite::Connection& connection) -> base::Result<void> {
    for (const CounterChange& change : changes) {
      if (auto written = host::record(connection, change); !written) return written;
    }
    return {};
  };
  const std::scoped_lock lock(mutex_);
  auto written = database_.write(
      CounterDatabase::Missing::create,
      [&](sqlite::Connection& connection) {
        // One change is a transaction of its own.
        if (changes.size() == 1) return writeAll(connection);
        return inTransaction(connection, [&] { return writeAll(connection); });
      },
      kept);
  const bool refused = !written && CounterDatabase::refusedForNow(written.error());
  if (refused) {
    if (const auto waits = database_.keepWaiting(changes); !waits) {
      return base::Error{written.error().text + "; nor can it wait: " + waits.error().text};
    }
    if (!refused_) {
      place_.log.log(platform::LogLevel::standard, "%s; what is to be recorded waits beside it",
                     written.error().text.c_str());
    }
    written = {};
  }
  refused_ = refused;
  return written;
}

base::Result<void> CounterStore::set(std::string_view key, std::int64_t value, std::int32_t day) {
  const CounterChange change{
      .kind = CounterChange::Kind::set, .key = key, .day = day, .amount = value};
  return apply({&change, 1});
}

base::Result<void> CounterStore::add(std::string_view key, std::int64_t value, std::int32_t day) {
  const CounterChange change{
      .kind = CounterChange::Kind::add, .key = key, .day = day, .amount = value};
  return apply({&change, 1});
}

base::Result<void> CounterStore::push(std::string_view key, double value, std::int32_t day,
                                      std::int32_t seconds) {
  const CounterChange change{.kind = CounterChange::Kind::push,
                             .key = key,
                             .day = day,
                             .sample = value,
                             .seconds = seconds};
  return apply({&change, 1});
}

}  // namespace host
