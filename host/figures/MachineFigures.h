// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// This machine's own figures.
//
// libproc2 reads the disks, the memory and the load. By hand are read /proc/vmstat, where the
// library doesn't know every event and takes one that this kernel doesn't count for 0; what the
// library doesn't read: /proc/pressure, the network devices; and the temperatures, for which
// libsensors would want a configuration of its own.
#pragma once

#include <cstdint>
#include <string>
#include <utility>
#include <vector>

#include "host/files/DeviceRoot.h"

namespace host::figures {

struct MachineFigures {
  std::string boot;   // the identifier of the boot that the counts are of; empty: unknown
  double uptime = 0;  // seconds since then
  std::vector<std::pair<std::string, std::int64_t>> counts;  // what grew since the machine started
  std::vector<std::pair<std::string, double>> measurements;  // what holds at this moment
};

// All figures; what isn't there is left out.
//   host.vmstat.NAME: counts of the events named in a table
//   host.disk.DISK.NAME: counts, of whole disks but no loop or memory devices; times in
//     milliseconds, sectors of 512 bytes
//   host.net.INTERFACE.NAME: counts, of interfaces that are devices
//   host.pressure.RESOURCE.some.total, and full: counts of stalled microseconds
//   host.pressure.RESOURCE.some.avg10, and full: the percentage of the last ten seconds
//   host.meminfo.NAME: kilobytes
//   host.loadavg.1m, 5m and 15m
//   host.thermal.N.celsius, of thermal zones; host.sensor.CHIP.N.celsius, of sensor chips, those
//     of one name together
MachineFigures readMachineFigures();

// Those of them that are read by hand, of the files below a folder, and the boot. A line that isn't
// as expected is skipped, and a number that 64 bits don't hold saturates.
void addFiguresOfFiles(const DeviceRoot& files, MachineFigures& figures);

}  // namespace host::figures
