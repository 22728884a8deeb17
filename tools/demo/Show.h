// What a daily run left behind, as text for people.
#pragma once

#include <string>

#include "tools/demo/Device.h"

namespace demo {

struct ShowOptions {
  bool all = false;    // every row, not a selection
  std::string prefix;  // only counters whose keys begin so, and no header
};

// A report: its header; each reported scalar beside the recorded one and the rule that let it
// through; what was withheld; the distributions and their histograms.
std::string showLog(Device& device, const SubmittedLog& log, const ShowOptions& options);

// What a daily run leaves on the device: its records, the preferences that its tasking set, the
// support service's logs.
std::string showKept(Device& device);

// Everything that left the device, each part with the rule that let it through: the logs in the
// spool, today's counters as far as the telemetry set them, structured logs, events, and what the
// storage library hands to its callers.
std::string showLeft(Device& device, bool all);

}  // namespace demo
