// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "daemon/DataUsageChanges.h"

#include <cmath>

#include "platform/NetworkUsage.h"

namespace morvend {

using plist::Array;
using plist::Date;
using plist::Dictionary;
using plist::Number;
using plist::Value;

namespace {

// A record's counter, and its name in the keys.
constexpr struct {
  const char *name, *stem;
} kCounters[] = {{"wifiInBytes", "wifiIn"},
                 {"wifiOutBytes", "wifiOut"},
                 {"wwanInBytes", "wwanIn"},
                 {"wwanOutBytes", "wwanOut"}};

constexpr char kNamePrefix[] = "com.norba.";  // of processes without a bundle

std::int64_t integer(const Number* number) { return number != nullptr ? number->int64Value() : 0; }

// The difference of two counters that may be anything: it wraps around.
std::int64_t difference(std::int64_t value, std::int64_t previous) {
  return static_cast<std::int64_t>(static_cast<std::uint64_t>(value) -
                                   static_cast<std::uint64_t>(previous));
}

// The baseline entry of a process, if its bytes were counted since the same date.
const Array* entryOfSamePeriod(const Dictionary& baseline, const std::string& name, Date since) {
  const Array* entry = baseline.array(name);
  const Date* date = entry != nullptr && !entry->empty() ? entry->front().as<Date>() : nullptr;
  const bool same =
      date != nullptr && std::floor(date->secondsSince1970) == std::floor(since.secondsSince1970);
  return same ? entry : nullptr;
}

class Changes {
 public:
  Changes(const Dictionary& baseline, Date yesterday, DataUsageChanges& changes)
      : baseline_(baseline), yesterday_(yesterday), changes_(changes) {}

  void addRecord(const Dictionary& record) {
    const std::string* bundle = record.text("bundleName");
    const std::string* name = bundle != nullptr ? bundle : record.text("procName");
    const Date* since = record.date(platform::kUsageSinceKey);
    if (name == nullptr || since == nullptr) return;
    process_ = bundle != nullptr ? *name : kNamePrefix + *name;

    const Array* previous = entryOfSamePeriod(baseline_, *name, *since);
    const bool recent = since->secondsSince1970 >= yesterday_.secondsSince1970;
    Array entry{*since};
    for (const auto& counter : kCounters) {
      const Number* count = record.number(counter.name);
      const std::int64_t bytes = integer(count);
      const std::size_t place = entry.size();
      entry.emplace_back(count != nullptr ? *count : Number(0));
      if (previous == nullptr) {
        if (recent) ReportDataUsage(counter.stem, bytes);
        continue;
      }
      const std::int64_t used = difference(
          bytes, place < previous->size() ? integer((*previous)[place].as<Number>()) : 0);
      if (used >= 0) {
        ReportDataUsage(counter.stem, used);
      } else {
        add("datausage.baddata." + process_, 1);
      }
    }
    if (previous == nullptr && !recent) add("datausage.olddata." + process_, 1);
    changes_.baseline.set(*name, std::move(entry));
  }

 private:
  void ReportDataUsage(const char* stem, std::int64_t bytes) {
    const std::int64_t kibibytes = bytes / 1024;
    if (kibibytes != 0) add(std::string("datausage.") + stem + "KB." + process_, kibibytes);
  }

  void add(std::string key, std::int64_t value) {
    changes_.additions.push_back({std::move(key), value});
  }

  const Dictionary& baseline_;
  const Date yesterday_;
  DataUsageChanges& changes_;
  std::string process_;  // prefix and name
};

}  // namespace

DataUsageChanges dataUsageChanges(const Dictionary& baseline, const Array& records,
                                  Date yesterday) {
  DataUsageChanges changes;
  Changes day(baseline, yesterday, changes);
  for (const Value& record : records) {
    if (const auto* dictionary = record.as<Dictionary>()) day.addRecord(*dictionary);
  }
  return changes;
}

}  // namespace morvend
