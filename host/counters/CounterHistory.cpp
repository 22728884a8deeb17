// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/counters/CounterHistory.h"

#include <array>
#include <bit>
#include <cstring>
#include <string>

#include "base/UTF8.h"
#include "host/counters/SQLite.h"

namespace host {

namespace {

static_assert(std::endian::native == std::endian::little, "packed samples are little-endian");

// The sound rows of a statement that delivers day, key and more, in the order of day and key.
class Rows {
 public:
  using Sound = bool (*)(const sqlite::Statement&);

  Rows(sqlite::Statement& statement, std::string_view keyPrefix, Sound sound)
      : statement_(statement), keyPrefix_(keyPrefix), sound_(sound) {
    next();
  }

  bool valid() const { return valid_; }
  std::int32_t day() const { return day_; }
  std::string_view key() const { return key_; }  // as it is stored
  sqlite::Column column(int index) const { return statement_.column(index); }
  bool isAt(std::int32_t day, std::string_view key) const {
    return valid_ && day_ == day && key_ == key;
  }
  bool isBefore(std::int32_t day, std::string_view key) const {
    return valid_ && (day_ != day ? day_ < day : key_ < key);
  }

  // How the reading went so far; after a failure there is no row.
  const base::Result<void>& outcome() const { return outcome_; }

  void next() {
    valid_ = false;
    outcome_ = statement_.forEach([this] {
      valid_ = take();
      return !valid_;
    });
  }

 private:
  // Whether the statement's row is one.
  bool take() {
    const sqlite::Column day = statement_.column(0), key = statement_.column(1);
    if (!day.isInteger() || !key.isText() || !sound_(statement_)) return false;
    // The bounds of the query have 32 bits, and so has the day.
    day_ = static_cast<std::int32_t>(day.integer());
    key_ = key.bytes();
    return base::writable(key_, room_).starts_with(keyPrefix_);
  }

  sqlite::Statement& statement_;
  std::string_view keyPrefix_;
  Sound sound_;
  base::Result<void> outcome_;
  bool valid_ = false;
  std::int32_t day_ = 0;
  std::string_view key_;
  std::string room_;
};

bool hasRowid(const sqlite::Statement& row) { return row.column(2).isInteger(); }

// The distributions of a query, one after the other, each with its samples: what is packed, then
// what is still staged.
class StoredSamples : public platform::PLHistoryDistributionEnumerator {
 public:
  StoredSamples(sqlite::Connection& connection, std::string_view keyPrefix, std::int32_t firstDay,
                std::int32_t lastDay)
      : last_(lastDay),
        packed_(connection,
                "SELECT day, key, rowid FROM packed WHERE day BETWEEN ? AND ? "
                "ORDER BY day, key, rowid",
                firstDay, lastDay),
        staged_(connection,
                "SELECT day, key, seconds, value FROM staged WHERE day BETWEEN ? AND ? "
                "ORDER BY day, key, rowid",
                firstDay, lastDay),
        lastDay_(connection,
                 "SELECT day, key, rowid FROM packed WHERE day = ?1 AND ?1 > ?2 ORDER BY key",
                 lastDay, firstDay),
        packedRows_(packed_, keyPrefix, hasRowid),
        stagedRows_(staged_, keyPrefix,
                    [](const sqlite::Statement& row) {
                      return row.column(2).isInteger() && row.column(3).isReal();
                    }),
        lastDayRows_(lastDay_, keyPrefix, hasRowid),
        blobs_(connection, "packed", "samples") {
    arrive();
  }

  // Whether this is at a distribution, not at the end.
  bool valid() const { return valid_; }

  // Goes to the next one, past the samples that were not read.
  void next() {
    while (packedRows_.isAt(day_, key_)) packedRows_.next();
    while (stagedRows_.isAt(day_, key_)) stagedRows_.next();
    arrive();
  }
  std::int32_t day() const { return day_; }
  std::string_view key() const { return key_; }

  base::Result<Samples> getNextValues() override {
    for (; packedRows_.isAt(day_, key_); packedRows_.next(), unpacked_ = 0) {
      if (const std::size_t count = unpack(packedRows_.column(2).integer())) return block(count);
      if (!unpacking_) break;
    }
    std::size_t count = 0;
    for (; unpacking_ && count < kBlock && stagedRows_.isAt(day_, key_);
         stagedRows_.next(), ++count) {
      values_[count] = stagedRows_.column(3).real();
      seconds_[count] = static_cast<std::int32_t>(stagedRows_.column(2).integer());
    }
    if (!outcome()) return outcome().error();
    return block(count);
  }

  // How the reading went so far.
  const base::Result<void>& outcome() const {
    for (const Rows* rows : {&packedRows_, &stagedRows_, &lastDayRows_}) {
      if (!rows->outcome()) return rows->outcome();
    }
    return unpacking_;
  }

  bool comesAgain() override {
    if (day_ == last_ || day_ + 1 != last_) return false;
    // Both go through the keys in their order.
    while (lastDayRows_.isBefore(last_, key_)) lastDayRows_.next();
    return lastDayRows_.isAt(last_, key_);
  }

 private:
  static constexpr std::size_t kBlock = 512;

  void arrive() {
    valid_ = outcome() && (packedRows_.valid() || stagedRows_.valid());
    if (!valid_) return;
    const bool staged =
        !packedRows_.valid() || stagedRows_.isBefore(packedRows_.day(), packedRows_.key());
    const Rows& first = staged ? stagedRows_ : packedRows_;
    day_ = first.day();
    key_.assign(first.key());
    unpacked_ = 0;
  }

  Samples block(std::size_t count) const {
    return {{values_.data(), count}, {seconds_.data(), count}};
  }

  // The next records of a packed row; 0 at their end, and after a failure.
  std::size_t unpack(std::int64_t row) {
    if (unpacked_ == 0) {
      const auto size = blobs_.open(row);
      if (!size) unpacking_ = size.error();
      size_ = size ? *size : 0;
    }
    const std::size_t count = std::min(kBlock, size_ / kPackedSampleSize - unpacked_);
    const std::size_t offset = unpacked_ * kPackedSampleSize;
    if (count == 0) return 0;
    unpacking_ = blobs_.read(offset, {records_.data(), count * kPackedSampleSize});
    if (!unpacking_) return 0;
    const char* record = records_.data();
    for (std::size_t i = 0; i < count; ++i, record += kPackedSampleSize) {
      std::memcpy(&values_[i], record, sizeof(double));
      std::memcpy(&seconds_[i], record + sizeof(double), sizeof(std::int32_t));
    }
    unpacked_ += count;
    return count;
  }

  const std::int32_t last_;
  sqlite::Statement packed_, staged_, lastDay_;
  Rows packedRows_, stagedRows_, lastDayRows_;
  sqlite::BlobColumn blobs_;
  base::Result<void> unpacking_;
  bool valid_ = false;
  std::int32_t day_ = 0;
  std::string key_;
  std::size_t size_ = 0;      // of the current packed row's blob, once it is open
  std::size_t unpacked_ = 0;  // records of it that were handed out
  std::array<char, kBlock * kPackedSampleSize> records_;
  std::array<double, kBlock> values_;
  std::array<std::int32_t, kBlock> seconds_;
};

}  // namespace

base::Result<void> CounterHistory::scalarsForKeyPrefix(std::string_view keyPrefix,
                                                       std::int32_t minDaysSince1970,
                                                       std::int32_t maxDaysSince1970,
                                                       const ScalarRowHandler& rowHandler) {
  std::string prefixRoom, room;
  const std::string_view prefix = base::writable(keyPrefix, prefixRoom);
  return database_.read([&](sqlite::Connection& connection) {
    sqlite::Statement rows(connection,
                           "SELECT day, key, value FROM scalars WHERE day BETWEEN ? AND ? "
                           "ORDER BY day, key",
                           minDaysSince1970, maxDaysSince1970);
    bool stop = false;
    return rows.forEach([&] {
      const sqlite::Column day = rows.column(0), stored = rows.column(1), value = rows.column(2);
      if (!day.isInteger() || !stored.isText() || !value.isInteger()) return true;
      const std::string_view key = base::writable(stored.bytes(), room);
      if (!key.starts_with(prefix)) return true;
      rowHandler(key, static_cast<std::int32_t>(day.integer()), value.integer(), stop);
      return !stop;
    });
  });
}

base::Result<void> CounterHistory::distributionsForKeyPrefix(
    std::string_view keyPrefix, std::int32_t minDaysSince1970, std::int32_t maxDaysSince1970,
    const DistributionRowHandler& rowHandler) {
  std::string prefixRoom, room;
  const std::string_view prefix = base::writable(keyPrefix, prefixRoom);
  return database_.read([&](sqlite::Connection& connection) -> base::Result<void> {
    sqlite::Transaction snapshot(connection);
    if (auto begun = snapshot.begin(sqlite::Transaction::Kind::read); !begun) return begun;
    StoredSamples samples(connection, prefix, minDaysSince1970, maxDaysSince1970);
    for (bool stop = false; !stop && samples.valid(); samples.next()) {
      rowHandler(base::writable(samples.key(), room), samples.day(), samples, stop);
    }
    return samples.outcome();
  });
}

}  // namespace host
