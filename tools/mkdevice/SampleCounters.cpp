// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/mkdevice/SampleCounters.h"

#include <algorithm>
#include <cmath>

#include "base/CivilDate.h"
#include "base/Convert.h"
#include "tools/mkdevice/Random.h"
#include "tools/mkdevice/Vocabulary.h"

namespace mkdevice {

using host::CounterChange;

namespace {

bool isWeekend(std::int32_t day) {
  const auto weekday = (std::int64_t{day} % 7 + 11) % 7;  // day 0 was a Thursday; Sunday is 0
  return weekday == 0 || weekday == 6;
}

// What a counter's usual value is multiplied by. `age` is how many days before today.
double factorOfDay(Daily daily, std::int32_t day, std::int32_t age, Random& counter,
                   Random& random) {
  const double noise = 1 + 0.2 * (2 * random.fraction() - 1);
  switch (daily) {
    case Daily::constant:
      return 1;
    case Daily::steady:
      return noise;
    case Daily::workdays:
      return noise * (isWeekend(day) ? 0.5 : 1.15);
    case Daily::weekends:
      return noise * (isWeekend(day) ? 1.6 : 0.8);
    case Daily::growing:
      return 1 - 0.01 * counter.fraction() * age;
    case Daily::rare:
      return random.fraction() < 0.8 ? 0 : 0.2 + random.fraction();
  }
  return 1;
}

double sampleAround(double level, double spread, Shape shape, Random& random) {
  const double u = random.fraction();
  switch (shape) {
    case Shape::even:
      return level * (1 + spread * (2 * u - 1));
    case Shape::bell:
      return level * (1 + spread * random.bell());
    case Shape::longTail:
      return level * (1 - spread + spread * u / (1.15 - u));
  }
  return level;
}

// Most things happen while somebody is awake.
std::int32_t secondInDay(Random& random) {
  constexpr std::int64_t kMorning = 6 * 3600 + 1800, kNight = 23 * 3600 + 1800;
  const bool awake = random.fraction() < 0.85;
  return static_cast<std::int32_t>(awake ? random.between(kMorning, kNight)
                                         : random.between(0, base::kSecondsPerDay - 1));
}

double rounded(double value, double steps) { return std::round(value * steps) / steps; }

}  // namespace

std::string scaledKey(const char* key, int copy) {
  return copy == 1 ? key : std::string(key) + "." + std::to_string(copy);
}

SampleCounters::SampleCounters(const Sample& sample) : sample_(sample) {
  const auto addKeys = [&](std::vector<std::string>& keys, const auto& table) {
    for (const auto& row : table) {
      for (int copy = 1; copy <= sample.scale; ++copy) keys.push_back(scaledKey(row.key, copy));
    }
  };
  addKeys(scalars_, scalarTable());
  addKeys(distributions_, distributionTable());
}

std::vector<CounterChange> SampleCounters::ofDay(std::int32_t day) const {
  const std::int32_t age = sample_.today - day;
  const auto scale = static_cast<std::size_t>(sample_.scale);
  std::vector<CounterChange> changes;
  for (std::size_t i = 0; i < scalars_.size(); ++i) {
    const ScalarRow& row = scalarTable()[i / scale];
    Random counter(sample_.seed, scalars_[i]), random(sample_.seed, scalars_[i], day);
    const double value =
        static_cast<double>(row.typical) * factorOfDay(row.daily, day, age, counter, random);
    changes.push_back({.kind = CounterChange::Kind::set,
                       .key = scalars_[i],
                       .day = day,
                       .amount = base::saturatingCast<std::int64_t>(std::round(value))});
  }
  std::vector<std::int32_t> seconds;
  for (std::size_t i = 0; i < distributions_.size(); ++i) {
    const DistributionRow& row = distributionTable()[i / scale];
    Random counter(sample_.seed, distributions_[i]), random(sample_.seed, distributions_[i], day);
    // What hardly varies within a day hardly varies from day to day.
    const double factor = factorOfDay(row.daily, day, age, counter, random);
    const double level = row.typical * (1 + (factor - 1) * row.spread / 4);
    seconds.resize(
        static_cast<std::size_t>(random.between(row.samples - row.samples / 8, row.samples)));
    std::generate(seconds.begin(), seconds.end(), [&] { return secondInDay(random); });
    std::sort(seconds.begin(), seconds.end());
    for (const std::int32_t second : seconds) {
      const double sample = sampleAround(level, row.spread, row.shape, random);
      changes.push_back({.kind = CounterChange::Kind::push,
                         .key = distributions_[i],
                         .day = day,
                         .sample = rounded(sample, 100),
                         .seconds = second});
    }
  }
  return changes;
}

}  // namespace mkdevice
