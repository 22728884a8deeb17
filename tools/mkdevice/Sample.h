// A sample device as content: all that is in its root, made from a seed and a day.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "platform/PropertyList.h"
#include "platform/host/CounterStore.h"

namespace mkdevice {

enum class ControllerKind { qrt3, embedded, zmc };

struct Sample {
  std::uint64_t seed = 1;
  int scale = 1;           // so many times the vocabulary's counters
  std::int32_t today = 0;  // the counters end on the day before
  ControllerKind controller = ControllerKind::qrt3;
};

inline constexpr int kDaysOfCounters = 21;
inline constexpr int kLargestScale = 100;

// The key of the n-th counter that a larger scale makes of a row; the first has the row's own key.
std::string scaledKey(const char* key, int copy);

// The whitelist: key groups, their sections, the entries' options.
platform::Dictionary whitelist(int scale);

class SampleCounters {
 public:
  explicit SampleCounters(const Sample& sample);

  // What was recorded on a day: every scalar, then the samples of every distribution in the order
  // of their seconds. The keys are borrowed from this object.
  std::vector<platform::host::CounterChange> ofDay(std::int32_t day) const;

 private:
  Sample sample_;
  std::vector<std::string> scalars_, distributions_;  // `scale` keys for each row of the tables
};

// A file of the device and what it holds.
struct SampleFile {
  std::string path;
  platform::Value content;  // a text stands for itself, anything else for a property list
};

// The whitelist, the files below device/, the controller's among them, the preferences, and the
// logs that a daily run will move.
std::vector<SampleFile> sampleFiles(const Sample& sample);

}  // namespace mkdevice
