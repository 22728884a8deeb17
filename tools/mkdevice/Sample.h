// A sample device as content: all that is in its root, made from a seed and a day.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "host/counters/CounterStore.h"
#include "plist/Value.h"

namespace mkdevice {

enum class ControllerKind { qrt3, embedded, zmc };

// The flash chips, each with another layout of the telemetry list's counters.
enum class ChipKind { qm7, qm8, sandisk1x, hynix1x, other1y };

struct Sample {
  std::uint64_t seed = 1;
  int scale = 1;           // so many times the vocabulary's counters
  std::int32_t today = 0;  // the counters end on the day before
  ControllerKind controller = ControllerKind::qrt3;
  std::optional<ChipKind> chip = {};  // the seed decides
};

inline constexpr int kDaysOfCounters = 21;
inline constexpr int kLargestScale = 100;

// The key of the n-th counter that a larger scale makes of a row; the first has the row's own key.
std::string scaledKey(const char* key, int copy);

// The whitelist: key groups, their sections, the entries' options.
plist::Dictionary whitelist(int scale);

class SampleCounters {
 public:
  explicit SampleCounters(const Sample& sample);

  // What was recorded on a day: every scalar, then the samples of every distribution in the order
  // of their seconds. The keys are borrowed from this object.
  std::vector<host::CounterChange> ofDay(std::int32_t day) const;

 private:
  Sample sample_;
  std::vector<std::string> scalars_, distributions_;  // `scale` keys for each row of the tables
};

// A file of the device and what it holds.
struct SampleFile {
  std::string path;
  plist::Value content;  // a text stands for itself, anything else for a property list
};

// What stays from day to day: the whitelist, most files below device/, the preferences; and logs of
// the days before.
std::vector<SampleFile> lastingFiles(const Sample& sample);

// What is new every day, as it is when `today` begins: the buffers of the controller, disk and
// network usage, the reporting channels, the memory errors that came in, and the kernel's values.
// Yesterday's logs of the support service are among them: a daily run moves them.
std::vector<SampleFile> filesOfDay(const Sample& sample);

}  // namespace mkdevice
