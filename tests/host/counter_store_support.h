// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// A counters store over a temporary device root, and what a history holds as text.
#pragma once

#include <gtest/gtest.h>
#include <sqlite3.h>

#include <chrono>
#include <filesystem>
#include <optional>
#include <string>
#include <vector>

#include "HostServices.h"
#include "base/Text.h"
#include "host/counters/CounterStore.h"
#include "platform/PLHistory.h"

namespace support {

inline constexpr char kDatabase[] = "var/mobile/Library/Pelloran/PLDataStore.sqlitedb";

// The rows of a history, one line each: "day key value", "day key second:value second:value". The
// log says why some can't be read.
inline std::vector<std::string> rows(platform::PLHistory& history, platform::SystemLog& log,
                                     std::string_view prefix = "", std::int32_t first = INT32_MIN,
                                     std::int32_t last = INT32_MAX) {
  std::vector<std::string> lines;
  auto read = history.scalarsForKeyPrefix(
      prefix, first, last, [&](std::string_view key, std::int32_t day, std::int64_t value, bool&) {
        lines.push_back(std::to_string(day) + " " + std::string(key) + " " + std::to_string(value));
      });
  if (read)
    read = history.distributionsForKeyPrefix(
        prefix, first, last,
        [&](std::string_view key, std::int32_t day,
            platform::PLHistoryDistributionEnumerator& samples, bool&) {
          std::string line = std::to_string(day) + " " + std::string(key);
          for (auto block = samples.getNextValues(); block && !block->values.empty();
               block = samples.getNextValues()) {
            for (std::size_t i = 0; i < block->values.size(); ++i) {
              line += base::format(" %d:", block->secondsInDayOffsets[i]) +
                      base::doubleText(block->values[i]);
            }
          }
          lines.push_back(line);
        });
  if (!read) log.log(platform::LogLevel::error, "%s", read.error().text.c_str());
  return lines;
}

// Runs SQL on a database behind the store's back; the text of the last value that it delivers.
inline std::string sql(const std::filesystem::path& file, const char* text) {
  sqlite3* database = nullptr;
  EXPECT_EQ(sqlite3_open(file.c_str(), &database), SQLITE_OK);
  std::string last;
  const auto keep = [](void* into, int count, char** values, char**) {
    if (count > 0 && values[count - 1] != nullptr) {
      *static_cast<std::string*>(into) = values[count - 1];
    }
    return 0;
  };
  EXPECT_EQ(sqlite3_exec(database, text, keep, &last, nullptr), SQLITE_OK)
      << sqlite3_errmsg(database);
  sqlite3_close(database);
  return last;
}

struct StoreFixture {
  explicit StoreFixture(const std::filesystem::path& path) : root(path.string(), pause) {}

  std::vector<std::string> rows() { return support::rows(*store.initWithDefaultPath(), log); }

  std::chrono::milliseconds waited{0};
  bool sleeps = false;  // while it waits for other processes
  host::sqlite::Pause pause = [this](std::chrono::milliseconds time) {
    waited += time;
    if (sleeps) host::LockWait::sleepFor(time);
  };
  host::DeviceRoot root;
  SetClock clock;
  platform::fakes::RecordingLog log;
  std::optional<std::string> home = "/var/mobile";
  int damaged = 0;
  host::CounterStore store{root, clock, log, [this] { return home; }, [this] { ++damaged; }, pause};
};

}  // namespace support
