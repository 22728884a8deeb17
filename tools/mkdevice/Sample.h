// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Which sample device: all that is in its root is made from a seed and a day.
#pragma once

#include <cstdint>
#include <optional>
#include <string>

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
inline constexpr int kMaxScale = 100;

// A file of the device and what it holds.
struct SampleFile {
  std::string path;
  plist::Value content;  // a text stands for itself, anything else for a property list
};

}  // namespace mkdevice
