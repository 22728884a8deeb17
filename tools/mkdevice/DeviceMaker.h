// Makes a sample device root in a folder.
#pragma once

#include <functional>
#include <string>

#include "tools/mkdevice/Sample.h"

namespace mkdevice {

struct MakingOptions {
  std::string folder;  // of the host; missing parents are made
  Sample sample;
  std::string module;  // of the host: the crash-reporting support library for the device
};

// Reports what goes on, and what the root will lack.
struct Listener {
  std::function<void(const std::string&)> progress, warning;
};

// Makes the root. Returns the empty text, or what went wrong and where. A folder that holds
// anything is refused and left as it is; one that couldn't be filled to the end is left half-made.
std::string makeDevice(const MakingOptions& options, const Listener& listener);

}  // namespace mkdevice
