// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// This machine's own figures.
//
// libproc2 reads the disks, the memory and the load. By hand are read /proc/vmstat, where the
// library doesn't know every event and takes one that this kernel doesn't count for 0;
// /proc/pressure, which it doesn't read; and the thermal zones, which libsensors doesn't know, only
// chips under other numbers.
#pragma once

#include <cstdint>
#include <string>
#include <utility>
#include <vector>

namespace host::figures {

struct MachineFigures {
  std::vector<std::pair<std::string, std::int64_t>> counts;  // what grew since the machine started
  std::vector<std::pair<std::string, double>> measurements;  // what holds at this moment
};

// All figures; what isn't there is left out.
//   host.vmstat.NAME, host.disk.DISK.NAME: counts, of the events named in a table, and of whole
//     disks but no loop or memory devices; times in milliseconds
//   host.meminfo.NAME: kilobytes
//   host.loadavg.1m, 5m and 15m
//   host.pressure.RESOURCE.some.avg10, and full: the percentage of the last ten seconds;
//     host.pressure.RESOURCE.some.total: a count, of stalled microseconds
//   host.thermal.N.celsius
MachineFigures readMachineFigures();

// Those of them that are read by hand, of the files below `root`. A line that isn't as expected is
// skipped, and a number that 64 bits don't hold saturates.
void addFiguresOfFiles(const std::string& root, MachineFigures& figures);

}  // namespace host::figures
