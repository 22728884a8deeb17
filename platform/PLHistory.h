// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The counters history store: what the counters service recorded, by day and key.
#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <span>
#include <string_view>

#include "base/Result.h"

namespace platform {

// The samples of one key and day, in the order in which they were recorded.
class PLHistoryDistributionEnumerator {
 public:
  // Values beside their offsets in seconds within the day; the two spans have the same length.
  struct Samples {
    std::span<const double> values;
    std::span<const std::int32_t> secondsInDayOffsets;
  };

  virtual ~PLHistoryDistributionEnumerator() = default;

  // The next samples, as many as the store has at hand; empty at the end. They are borrowed until
  // the next call. Samples come in blocks because a call for each would double the cost of reading;
  // those that nobody asks for aren't read. After an error what came is not all of them; the query
  // ends with the same error.
  virtual base::Result<Samples> getNextValues() = 0;

  // Whether the query has a row of the same key for its last day too; known on the day before that.
  virtual bool comesAgain() { return false; }
};

class PLHistory {
 public:
  // Called once a row. The key and the enumerator are borrowed until the handler returns; a handler
  // that sets `stop` gets no further row.
  using ScalarRowHandler =
      std::function<void(std::string_view key, std::int32_t day, std::int64_t value, bool& stop)>;
  using DistributionRowHandler =
      std::function<void(std::string_view key, std::int32_t day,
                         PLHistoryDistributionEnumerator& samples, bool& stop)>;

  virtual ~PLHistory() = default;

  // The rows whose key begins with the prefix, from the first to the last day, both included,
  // ordered by day and then by key (bytewise). After an error there is no further row: what was
  // delivered is not all that there is. It is std::errc::resource_unavailable_try_again when the
  // query may go well another time.
  virtual base::Result<void> scalarsForKeyPrefix(std::string_view keyPrefix,
                                                 std::int32_t minDaysSince1970,
                                                 std::int32_t maxDaysSince1970,
                                                 const ScalarRowHandler& rowHandler) = 0;
  virtual base::Result<void> distributionsForKeyPrefix(
      std::string_view keyPrefix, std::int32_t minDaysSince1970, std::int32_t maxDaysSince1970,
      const DistributionRowHandler& rowHandler) = 0;
};

class HistoryStore {
 public:
  virtual ~HistoryStore() = default;

  // Opens the history on the store's default database. Never null: a database that is not there
  // reads as an empty history, one that can't be opened as one whose queries fail.
  virtual std::unique_ptr<PLHistory> initWithDefaultPath() = 0;
};

}  // namespace platform
