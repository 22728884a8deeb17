// What a daily run left behind, as text for people.
#pragma once

#include <string>

#include "tools/demo/Device.h"

namespace demo {

struct ShowOptions {
  bool all = false;         // every row, not a selection
  bool headerOnly = false;  // nothing but the header
  std::string prefix;       // only counters whose keys begin so
};

// A report: its header; each reported scalar beside the recorded one and the rule that let it
// through; what was withheld; the distributions and their histograms.
std::string showLog(Device& device, const SubmittedLog& log, const ShowOptions& options);

// The files that a daily run writes beside its report, and what is in them.
std::string showFiles(Device& device);

}  // namespace demo
