// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/mkdevice/Wear.h"

#include <algorithm>
#include <cmath>

#include "base/CivilDate.h"
#include "base/Convert.h"
#include "tools/mkdevice/Random.h"

namespace mkdevice {

namespace {

constexpr std::int64_t kEarliestFormat = 18993;  // 2022-01-01
constexpr std::int64_t kYoungest = 60;           // days: older than the oldest snapshot
constexpr std::uint64_t kSectorsPerPage = kBytesPerPage / 4096;

std::uint64_t times(std::uint64_t value, double factor) {
  return base::saturatingCast<std::uint64_t>(static_cast<double>(value) * factor);
}

const WearCounter* findWearCounter(std::string_view name) {
  const auto rows = wearCounterTable();
  const auto row = std::ranges::find_if(rows, [&](const auto& r) { return name == r.name; });
  return row != rows.end() ? &*row : nullptr;
}

// Bands by how much of them is valid: none between the empty ones and the first bucket in use,
// which moves from hour to hour.
std::vector<std::uint64_t> bandsOfValidity(const Wear& wear, std::size_t buckets) {
  Random random(wear.seed, "validity", static_cast<std::int64_t>(wear.hours));
  const auto first = static_cast<std::size_t>(random.between(6, 19));
  std::vector<std::uint64_t> bands(buckets, 0);
  for (std::size_t i = first; i < buckets; ++i) bands[i] = 2 + (i - first) * 2;
  return bands;
}

// What no row describes happens between once in ten days and a few hundred times a day.
CounterFamily familyOf(std::string_view name, Random& random) {
  for (const CounterFamily& row : counterFamilyTable()) {
    if (name.find(row.part) != name.npos) return row;
  }
  return {"", Growth::counted, std::pow(10, -1 + 3.5 * random.fraction())};
}

}  // namespace

Wear::Wear(const Sample& sample, int hoursAgo) : seed(sample.seed) {
  Random random(seed, "flash");
  const std::int64_t formatDay =
      std::min(kEarliestFormat + random.between(0, 1000), sample.today - kYoungest);
  const double writesPerDay = 3.1e6 * (0.5 + random.fraction());
  const double readsPerWrite = 1.8 + random.fraction(), amplification = 1.6 + random.fraction();
  const double fastAmplification = 0.6 + 0.4 * random.fraction();

  formatTime = static_cast<std::uint64_t>(formatDay * base::kSecondsPerDay);
  time = static_cast<std::uint64_t>(sample.today * base::kSecondsPerDay -
                                    std::int64_t{hoursAgo} * 3600);
  hours = (time - formatTime) / 3600;
  magazineMeta = (time & 0xFFFFFFFF) << 24 | (hours & 0xFFFFFF);
  hostWrites = sinceFormat(writesPerDay);
  hostReads = times(hostWrites, readsPerWrite);
  nandWrites = times(hostWrites, amplification + fastAmplification);
  nandReads = times(hostReads, 1.3);
  bandErases = times(hostWrites, amplification) / (kPagesPerBand * kSectorsPerPage);
  fastBandErases = times(hostWrites, fastAmplification) / (kPagesPerFastBand * kSectorsPerPage);
  cycles = bandErases / (kBands - kFirstUserBand);
  fastCycles = fastBandErases / (kFirstUserBand - kFirstFastBand);
}

std::uint64_t Wear::sinceFormat(double perDay) const {
  return base::saturatingCast<std::uint64_t>(perDay * static_cast<double>(hours) / 24);
}

std::vector<std::uint64_t> counterValues(const Wear& wear, std::string_view name,
                                         std::size_t elements, std::uint64_t unit) {
  if (name == "vcurve") return bandsOfValidity(wear, elements);
  if (const WearCounter* row = findWearCounter(name)) {
    const std::uint64_t grown = row->source ? wear.*row->source * row->multiplier : 0;
    return std::vector(elements, std::min(row->most, row->base + grown / row->divisor));
  }
  Random counter(wear.seed, name), random(wear.seed, name, static_cast<std::int64_t>(unit + 1));
  const CounterFamily family = familyOf(name, counter);
  const double middle = static_cast<double>(elements - 1) / 2;
  std::vector<std::uint64_t> values;
  for (std::size_t i = 0; i < elements; ++i) {
    const auto place = static_cast<double>(i);
    const double varied = family.figure * (0.9 + 0.2 * random.fraction());
    const double distance = elements > 1 ? (place - middle) / middle : 0;
    switch (family.growth) {
      case Growth::counted:
        values.push_back(wear.sinceFormat(varied * std::pow(0.7, place)));
        break;
      case Growth::bell:
        values.push_back(wear.sinceFormat(varied * std::exp(-4 * distance * distance)));
        break;
      case Growth::level:
        values.push_back(base::saturatingCast<std::uint64_t>(std::round(varied)));
        break;
    }
  }
  return values;
}

}  // namespace mkdevice
