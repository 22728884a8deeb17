#include "host/counters/CounterHistory.h"

#include <array>
#include <bit>
#include <cstring>
#include <limits>
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
  bool isAt(std::int32_t day, std::string_view key) const {
    return valid_ && day_ == day && key_ == key;
  }
  bool isBefore(const Rows& other) const {
    if (!valid_ || !other.valid_) return valid_;
    return day_ != other.day_ ? day_ < other.day_ : key_ < other.key_;
  }

  void next() {
    while ((valid_ = statement_.step())) {
      const sqlite::Column day = statement_.column(0), key = statement_.column(1);
      if (!day.isInteger() || !key.isText() || !sound_(statement_)) continue;
      // The bounds of the query have 32 bits, and so has the day.
      day_ = static_cast<std::int32_t>(day.integer());
      key_ = key.bytes();
      if (base::writable(key_, room_).starts_with(keyPrefix_)) return;
    }
  }

 private:
  sqlite::Statement& statement_;
  std::string_view keyPrefix_;
  Sound sound_;
  bool valid_ = false;
  std::int32_t day_ = 0;
  std::string_view key_;
  std::string room_;
};

// The samples of one day and key: what is packed, then what is still staged.
class StoredSamples : public platform::PLHistoryDistributionEnumerator {
 public:
  StoredSamples(const sqlite::Statement& packed, Rows& packedRows, const sqlite::Statement& staged,
                Rows& stagedRows)
      : packed_(packed), packedRows_(packedRows), staged_(staged), stagedRows_(stagedRows) {}

  void begin(std::int32_t day, std::string_view key) {
    day_ = day;
    key_.assign(key);
    unpacked_ = 0;
  }
  std::int32_t day() const { return day_; }
  std::string_view key() const { return key_; }

  Samples getNextValues() override {
    for (; packedRows_.isAt(day_, key_); packedRows_.next(), unpacked_ = 0) {
      if (const std::size_t count = unpack(packed_.column(2).bytes())) return block(count);
    }
    std::size_t count = 0;
    for (; count < kBlock && stagedRows_.isAt(day_, key_); stagedRows_.next(), ++count) {
      values_[count] = staged_.column(3).real();
      seconds_[count] = static_cast<std::int32_t>(staged_.column(2).integer());
    }
    return block(count);
  }

  // Passes over what was not read.
  void finish() {
    while (packedRows_.isAt(day_, key_)) packedRows_.next();
    while (stagedRows_.isAt(day_, key_)) stagedRows_.next();
  }

 private:
  static constexpr std::size_t kBlock = 512;

  Samples block(std::size_t count) const {
    return {{values_.data(), count}, {seconds_.data(), count}};
  }

  std::size_t unpack(std::string_view bytes) {
    const std::size_t count = std::min(kBlock, bytes.size() / kPackedSampleSize - unpacked_);
    const char* record = bytes.data() + unpacked_ * kPackedSampleSize;
    for (std::size_t i = 0; i < count; ++i, record += kPackedSampleSize) {
      std::memcpy(&values_[i], record, sizeof(double));
      std::memcpy(&seconds_[i], record + sizeof(double), sizeof(std::int32_t));
    }
    unpacked_ += count;
    return count;
  }

  const sqlite::Statement& packed_;
  Rows& packedRows_;
  const sqlite::Statement& staged_;
  Rows& stagedRows_;
  std::int32_t day_ = 0;
  std::string key_;
  std::size_t unpacked_ = 0;  // records of the current packed row that were handed out
  std::array<double, kBlock> values_;
  std::array<std::int32_t, kBlock> seconds_;
};

}  // namespace

void CounterHistory::scalarsForKeyPrefix(std::string_view keyPrefix, std::int32_t minDaysSince1970,
                                         std::int32_t maxDaysSince1970,
                                         const ScalarRowHandler& rowHandler) {
  if (failed_) return;
  std::string prefixRoom, room;
  const std::string_view prefix = base::writable(keyPrefix, prefixRoom);
  failed_ = !database_.read([&](sqlite::Connection& connection) {
    sqlite::Statement rows(connection,
                           "SELECT day, key, value FROM scalars WHERE day BETWEEN ? AND ? "
                           "ORDER BY day, key",
                           minDaysSince1970, maxDaysSince1970);
    bool stop = false;
    while (!stop && rows.step()) {
      const sqlite::Column day = rows.column(0), stored = rows.column(1), value = rows.column(2);
      if (!day.isInteger() || !stored.isText() || !value.isInteger()) continue;
      const std::string_view key = base::writable(stored.bytes(), room);
      if (!key.starts_with(prefix)) continue;
      rowHandler(key, static_cast<std::int32_t>(day.integer()), value.integer(), stop);
    }
  });
}

void CounterHistory::distributionsForKeyPrefix(std::string_view keyPrefix,
                                               std::int32_t minDaysSince1970,
                                               std::int32_t maxDaysSince1970,
                                               const DistributionRowHandler& rowHandler) {
  if (failed_) return;
  std::string prefixRoom, room;
  const std::string_view prefix = base::writable(keyPrefix, prefixRoom);
  failed_ = !database_.read([&](sqlite::Connection& connection) {
    const sqlite::Transaction snapshot(connection, sqlite::Transaction::Kind::read);
    sqlite::Statement packed(connection,
                             "SELECT day, key, samples FROM packed WHERE day BETWEEN ? AND ? "
                             "ORDER BY day, key, rowid",
                             minDaysSince1970, maxDaysSince1970);
    sqlite::Statement staged(
        connection,
        "SELECT day, key, seconds, value FROM staged WHERE day BETWEEN ? AND ? "
        "ORDER BY day, key, rowid",
        minDaysSince1970, maxDaysSince1970);
    // The type of the data is known without reading them.
    Rows packedRows(packed, prefix,
                    [](const sqlite::Statement& row) { return row.column(2).isBlob(); });
    Rows stagedRows(staged, prefix, [](const sqlite::Statement& row) {
      return row.column(2).isInteger() && row.column(3).isReal();
    });
    StoredSamples samples(packed, packedRows, staged, stagedRows);
    bool stop = false;
    while (!stop && (packedRows.valid() || stagedRows.valid())) {
      const Rows& first = stagedRows.isBefore(packedRows) ? stagedRows : packedRows;
      samples.begin(first.day(), first.key());
      rowHandler(base::writable(samples.key(), room), samples.day(), samples, stop);
      samples.finish();
    }
  });
}

}  // namespace host
