// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What a day has had of this machine's figures, from readings of totals that only grow.
#pragma once

#include <cstdint>
#include <string>
#include <utility>
#include <vector>

#include "host/figures/MachineFigures.h"

namespace host::figures {

struct DayFigures {
  std::vector<std::pair<std::string, std::int64_t>> additions;  // to the day's scalars
  std::vector<std::pair<std::string, double>> samples;          // of the day's distributions
  std::string remembered;                                       // for the next reading
};

// `remembered` is what the reading before led to; empty, or anything else, when there is none.
//
// What a count has grown by since that reading is added, 0 too. Since a reading of another boot it
// has grown by all that it is, and so has one that went down (it wrapped around, or its device came
// anew) and one that was not there. Without a reading before, nothing is added: what the total is
// of, nobody knows.
//
// The samples are the measurements, and what disks and network devices have moved since the reading
// before in bytes per second: host.disk.DISK.read_bytes_per_second and written_…,
// host.net.INTERFACE.rx_bytes_per_second and tx_….
DayFigures dayFigures(const std::string& remembered, const MachineFigures& figures);

}  // namespace host::figures
