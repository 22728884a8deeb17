// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The counters store beside bare SQLite: querying two of sixty days, and adding a sample.
#include <sqlite3.h>

#include <cstring>
#include <stdexcept>
#include <string>
#include <tuple>
#include <vector>

#include "bench/Rows.h"
#include "host/Host.h"
#include "platform/PLHistory.h"
#include "support/TemporaryFolder.h"

namespace {

constexpr std::int32_t kDays = 60;
constexpr int kScalars = 5000, kDistributions = 1000, kSamples = 100;
constexpr int kAppends = 2000;

// A device root in a temporary folder, with a store.
struct Device {
  support::TemporaryFolder root;
  host::Host host{{.root = root.path()}};
  host::CounterStore& store = host.counters();
};

// Bare SQLite, on the store's file or on one of its own.
class Bare {
 public:
  Bare(const std::string& path, const char* setUp) {
    check(sqlite3_open_v2(path.c_str(), &database_,
                          SQLITE_OPEN_READWRITE | SQLITE_OPEN_CREATE | SQLITE_OPEN_NOMUTEX,
                          nullptr));
    check(sqlite3_exec(database_, setUp, nullptr, nullptr, nullptr));
  }
  ~Bare() {
    sqlite3_finalize(statement_);
    sqlite3_close(database_);
  }
  sqlite3_stmt* prepare(const char* sql) {
    check(sqlite3_prepare_v2(database_, sql, -1, &statement_, nullptr));
    return statement_;
  }

 private:
  void check(int code) {
    if (code != SQLITE_OK) throw std::runtime_error(sqlite3_errmsg(database_));
  }
  sqlite3* database_ = nullptr;
  sqlite3_stmt* statement_ = nullptr;
};

void fill(Device& device) {
  using host::CounterChange;
  std::vector<std::string> keys;
  for (int i = 0; i < kScalars; ++i) {
    keys.push_back("com.example.subsystem.counter." + std::to_string(i));
  }
  for (std::int32_t day = 0; day < kDays; ++day) {
    std::vector<CounterChange> changes;
    for (int i = 0; i < kScalars; ++i) {
      const auto key = static_cast<std::size_t>(i);
      changes.push_back(
          {.kind = CounterChange::Kind::set, .key = keys[key], .day = day, .amount = i * 977});
    }
    for (int i = 0; i < kDistributions * kSamples; ++i) {
      changes.push_back({.kind = CounterChange::Kind::push,
                         .key = keys[static_cast<std::size_t>(i % kDistributions)],
                         .day = day,
                         .sample = i * 0.37,
                         .seconds = i % 86400});
    }
    if (const auto applied = device.store.apply(changes); !applied) {
      throw std::runtime_error(applied.error().text);
    }
  }
  device.store.PLClientCheckpoint();
}

void addQueryRows(bench::Table& table) {
  Device device;
  fill(device);
  Bare bare(device.root / support::kCountersDatabase,
            "PRAGMA cell_size_check = ON; PRAGMA cache_size = -128");
  Bare bareSamples(device.root / support::kCountersDatabase,
                   "PRAGMA cell_size_check = ON; PRAGMA cache_size = -128");
  const auto history = device.store.initWithDefaultPath();

  sqlite3_stmt* scan = bare.prepare(
      "SELECT day, key, value FROM scalars WHERE day BETWEEN ? AND ? ORDER BY day, key");
  std::int64_t sum = 0;
  table.compare(
      "history query, scalars of 2 of 60 days", "bare scan of those rows, per row", 1.2,
      2.0 * kScalars,
      [&] {
        std::ignore = history->scalarsForKeyPrefix(
            "", kDays - 2, kDays - 1,
            [&](std::string_view key, std::int32_t day, std::int64_t value, bool&) {
              sum += value + day + static_cast<std::int64_t>(key.size());
            });
        bench::keep(sum);
      },
      [&] {
        sqlite3_bind_int(scan, 1, kDays - 2);
        sqlite3_bind_int(scan, 2, kDays - 1);
        while (sqlite3_step(scan) == SQLITE_ROW) {
          sum += sqlite3_column_int(scan, 0);
          bench::keep(sqlite3_column_text(scan, 1));
          sum += sqlite3_column_bytes(scan, 1) + sqlite3_column_int64(scan, 2);
        }
        sqlite3_reset(scan);
        bench::keep(sum);
      },
      31);

  sqlite3_stmt* sampleScan = bareSamples.prepare(
      "SELECT day, key, samples FROM packed WHERE day BETWEEN ? AND ? ORDER BY day, key");
  double total = 0;
  table.compare(
      "history query, samples of 2 of 60 days", "bare scan of those rows, per sample", 1.5,
      2.0 * kDistributions * kSamples,
      [&] {
        std::ignore = history->distributionsForKeyPrefix(
            "", kDays - 2, kDays - 1,
            [&](std::string_view, std::int32_t, platform::PLHistoryDistributionEnumerator& samples,
                bool&) {
              for (auto block = samples.getNextValues(); block && !block->values.empty();
                   block = samples.getNextValues()) {
                for (const double value : block->values) total += value;
              }
            });
        bench::keep(total);
      },
      [&] {
        sqlite3_bind_int(sampleScan, 1, kDays - 2);
        sqlite3_bind_int(sampleScan, 2, kDays - 1);
        while (sqlite3_step(sampleScan) == SQLITE_ROW) {
          bench::keep(sqlite3_column_int(sampleScan, 0));
          bench::keep(sqlite3_column_text(sampleScan, 1));
          const auto* bytes = static_cast<const char*>(sqlite3_column_blob(sampleScan, 2));
          const int size = sqlite3_column_bytes(sampleScan, 2);
          for (int at = 0; at + 12 <= size; at += 12) {
            double value;
            std::memcpy(&value, bytes + at, sizeof value);
            total += value;
          }
        }
        sqlite3_reset(sampleScan);
        bench::keep(total);
      },
      31);
}

void addAppendRow(bench::Table& table) {
  Device device;
  Bare bare(device.root / "bare.sqlitedb",
            "PRAGMA journal_mode = WAL; PRAGMA synchronous = NORMAL; PRAGMA mmap_size = 0;"
            "PRAGMA cell_size_check = ON; PRAGMA wal_autocheckpoint = 1000;"
            "CREATE TABLE staged(day INTEGER NOT NULL, key TEXT NOT NULL, "
            "seconds INTEGER NOT NULL, value REAL NOT NULL) STRICT");
  constexpr char key[] = "com.example.subsystem.counter.1";
  sqlite3_stmt* append =
      bare.prepare("INSERT INTO staged(day, key, seconds, value) VALUES(?, ?, ?, ?)");
  table.compare(
      "adding a sample, one transaction each", "bare SQLite append", 1.5, kAppends,
      [&] {
        for (int i = 0; i < kAppends; ++i) {
          const auto pushed = device.store.push(key, i * 0.37, kDays, i);
          if (!pushed) throw std::runtime_error(pushed.error().text);
        }
      },
      [&] {
        for (int i = 0; i < kAppends; ++i) {
          sqlite3_bind_int(append, 1, kDays);
          sqlite3_bind_text(append, 2, key, sizeof key - 1, SQLITE_STATIC);
          sqlite3_bind_int(append, 3, i);
          sqlite3_bind_double(append, 4, i * 0.37);
          if (sqlite3_step(append) != SQLITE_DONE) throw std::runtime_error("append failed");
          sqlite3_reset(append);
        }
      });
}

}  // namespace

void bench::addCounterStoreRows(Table& table) {
  addQueryRows(table);
  addAppendRow(table);
}
