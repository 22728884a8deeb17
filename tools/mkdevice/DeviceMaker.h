// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Makes a sample device root in a folder, and plays days of its past.
#pragma once

#include <functional>
#include <string>

#include "base/Result.h"
#include "platform/SystemLog.h"
#include "tools/mkdevice/Sample.h"

namespace mkdevice {

inline constexpr int kMaxDays = 60;

struct MakingOptions {
  std::string folder;  // of the host; missing parents are made
  Sample sample;
  int days = 0;        // so many before `sample.today` are played, at most kMaxDays
  std::string module;  // of the host: the crash-reporting support library for the device
  platform::SystemLog* log = nullptr;  // of the device's services; else errors on standard error
};

// Reports what goes on, and what the root will lack.
struct Listener {
  std::function<void(const std::string&)> progress, warning;
};

// Makes the root. With days to play, makes it as it was before them; on each of them the device is
// used, its daily run comes due, and then its counters are recorded. A folder that holds anything
// is refused and left as it is; one that couldn't be filled to the end is left half-made.
base::Result<void> makeDevice(const MakingOptions& options, const Listener& listener);

}  // namespace mkdevice
