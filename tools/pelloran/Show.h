// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Prints what the counters' history holds.
#pragma once

#include <iosfwd>
#include <ostream>
#include <string_view>

#include "base/Result.h"
#include "platform/PLHistory.h"

namespace pelloran {

struct Shown {
  std::string_view prefix;
  std::int32_t firstDay, lastDay;
};

// Both order the rows by day and key, a scalar before a distribution of the same name. They show
// what can be read, and return why the rest can't.
base::Result<void> showTable(platform::PLHistory& history, const Shown& shown, std::ostream& out);
base::Result<void> showJsonLines(platform::PLHistory& history, const Shown& shown,
                                 std::ostream& out);

}  // namespace pelloran
