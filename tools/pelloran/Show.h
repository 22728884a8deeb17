// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Prints what the counters' history holds.
#pragma once

#include <iosfwd>
#include <ostream>
#include <string_view>

#include "platform/PLHistory.h"

namespace pelloran {

struct Shown {
  std::string_view prefix;
  std::int32_t firstDay, lastDay;
};

// Both order the rows by day and key, a scalar before a distribution of the same name.
void showTable(platform::PLHistory& history, const Shown& shown, std::ostream& out);
void showJsonLines(platform::PLHistory& history, const Shown& shown, std::ostream& out);

}  // namespace pelloran
