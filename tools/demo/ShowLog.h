// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// A submitted report, as text for people.
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

}  // namespace demo
