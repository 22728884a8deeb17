// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The counters service and the history store: an SQLite database below the device root.
#pragma once

#include <functional>
#include <memory>
#include <mutex>
#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "host/counters/CounterChange.h"
#include "host/counters/CounterHistory.h"
#include "platform/Clock.h"
#include "platform/CountersService.h"

namespace host {

// For any thread; each history for one. Nothing is opened before it is needed.
class CounterStore : public platform::CountersService, public platform::HistoryStore {
 public:
  // `home` yields the device path of the folder that holds the counters' data; while it yields none
  // there is no database: reads are empty, writes fail. `foundDamaged` is called once for each
  // database that is found damaged and set aside; it must not use the store. `pause` is how who
  // waits passes the time.
  CounterStore(const DeviceRoot& root, platform::Clock& clock, platform::SystemLog& log,
               std::function<std::optional<std::string>()> home, std::function<void()> foundDamaged,
               sqlite::Pause pause = LockWait::sleepFor);

  std::int32_t PLDaysSince1970() override;
  plist::Date PLDateFromDaysSince1970(std::int32_t day) override;

  // Packs the samples, drops what is older than the newest 60 days up to today that hold rows, and
  // brings the write-ahead log into the database file. Failures are logged.
  void PLClientCheckpoint() override;

  // Makes the database one file, as whoever copies it wants it.
  base::Result<void> settle();

  // Failures are logged, the same one once for as long as it lasts.
  void PLClientSetValueForScalarKey(std::string_view key, std::int64_t value) override;
  void PLClientAddValueForScalarKey(std::string_view key, std::int64_t value) override;
  // Several in one transaction: each of its own costs a dozen system calls.
  void PLClientSetValuesForScalarKeys(std::span<const platform::ScalarValue> values) override;
  void PLClientAddValuesForScalarKeys(std::span<const platform::ScalarValue> values) override;

  bool addValuesAndKeep(std::span<const platform::ScalarValue> values, std::string_view name,
                        std::string_view text) override;
  base::Result<std::string> keptText(std::string_view name) override;

  // Whether all of these values could be recorded; the error is the first one's.
  base::Result<void> recorded();

  // The history lives no longer than the store.
  std::unique_ptr<platform::PLHistory> initWithDefaultPath() override { return history(); }
  std::unique_ptr<CounterHistory> history() { return std::make_unique<CounterHistory>(place_); }

  // Records all the changes or none. What the database refuses for now waits in the journal, on
  // disk, and is recorded before the next write that it takes.
  using Kept = CounterDatabase::Kept;
  base::Result<void> apply(std::span<const CounterChange> changes, Kept kept = Kept::bySystem);

  // Records what `step` makes of the text that is kept under a name, and keeps the text that it
  // makes: all of it or nothing, and no other process comes in between. Nothing waits: after an
  // error nothing is recorded. The step may be asked a second time; the keys are borrowed from it.
  struct Step {
    std::vector<CounterChange> changes;
    std::string text;
  };
  base::Result<void> applyAndKeep(
      std::string_view name, const std::function<base::Result<Step>(const std::string&)>& step);

  base::Result<void> set(std::string_view key, std::int64_t value, std::int32_t day);
  base::Result<void> add(std::string_view key, std::int64_t value, std::int32_t day);
  base::Result<void> push(std::string_view key, double value, std::int32_t day,
                          std::int32_t seconds);

 private:
  void record(CounterChange::Kind kind, std::span<const platform::ScalarValue> values);
  bool noted(base::Result<void> outcome);

  CounterPlace place_;
  platform::Clock& clock_;
  std::mutex mutex_;  // over what follows
  CounterDatabase database_;
  bool refused_ = false;  // the last change, which waits
  base::Result<void> lastRecord_, recorded_;
};

}  // namespace host
