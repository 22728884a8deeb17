// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/mkdevice/SampleUsage.h"

#include <iterator>
#include <string>

#include "base/CivilDate.h"
#include "base/Convert.h"
#include "platform/NetworkUsage.h"
#include "tools/mkdevice/Random.h"

namespace mkdevice {

using plist::Array;
using plist::Dictionary;

namespace {

constexpr const char* kCounters[] = {"wifiInBytes", "wifiOutBytes", "wwanInBytes", "wwanOutBytes"};

struct Process {
  const char *name, *bundle;  // no bundle: null
  int daysOfLife;             // after so many it is started anew, and counts from 0
  double kibibytesPerDay[std::size(kCounters)];
  bool countsIn32Bits;  // and begins anew past them
};

constexpr Process kProcesses[] = {
    {"netconfigd", nullptr, 90, {310, 140, 60, 25}, false},
    {"clocksyncd", nullptr, 90, {22, 22, 3, 3}, false},
    {"backupd", nullptr, 30, {9200, 310000, 0, 0}, false},
    {"mediastreamd", nullptr, 30, {3.1e6, 64000, 210000, 9000}, true},
    {"updaterd", nullptr, 7, {88000, 900, 0.4, 0.2}, false},
    {"mail", "com.norba.mail", 12, {41000, 8800, 6200, 1900}, false},
    {"browser", "com.norba.browser", 3, {290000, 21000, 94000, 7700}, false},
    {"maps", "com.norba.maps", 1, {12000, 700, 26000, 1500}, false},
    {"podcatcher", "com.example.podcatcher", 5, {180000, 1300, 2100, 90}, false},
    {"departures", "com.example.departures", 2, {330, 60, 1400, 260}, false},
    {"chessboard", "com.example.chessboard", 45, {0.3, 0.2, 0, 0}, false},
};

}  // namespace

Dictionary networkUsage(const Sample& sample) {
  Array records;
  for (const Process& process : kProcesses) {
    Random random(sample.seed, process.name);
    const auto phase = static_cast<std::int32_t>(random.next() % 90);
    const std::int32_t start = sample.today - 1 - (sample.today + phase) % process.daysOfLife;
    const auto second = start * base::kSecondsPerDay + random.between(18000, 79200);
    Dictionary record{{"procName", process.name},
                      {platform::kUsageSinceKey, plist::Date{static_cast<double>(second)}}};
    if (process.bundle != nullptr) record.set("bundleName", process.bundle);
    for (std::size_t i = 0; i < std::size(kCounters); ++i) {
      std::uint64_t bytes = 0;
      for (std::int32_t day = start; day < sample.today; ++day) {
        Random ofDay(sample.seed, std::string(process.name) + kCounters[i], day);
        bytes += base::saturatingCast<std::uint64_t>(process.kibibytesPerDay[i] * 1024 *
                                                     (0.5 + ofDay.fraction()));
      }
      record.set(kCounters[i], process.countsIn32Bits ? bytes & UINT32_MAX : bytes);
    }
    records.push_back(std::move(record));
  }
  return {{"Records", std::move(records)}};
}

}  // namespace mkdevice
