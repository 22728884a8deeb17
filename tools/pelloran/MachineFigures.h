// This machine's own figures, as the kernel tells them in the files of /proc and /sys.
//
// The parsers are pure functions over a file's text; a line that isn't as expected is skipped, and
// a number that 64 bits don't hold saturates.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace pelloran {

struct MachineFigures {
  std::vector<std::pair<std::string, std::int64_t>> counts;  // what grew since the machine started
  std::vector<std::pair<std::string, double>> measurements;  // what holds at this moment
};

// /proc/vmstat: the events named in a table, as host.vmstat.NAME.
void parseVmstat(std::string_view text, MachineFigures& figures);

// /proc/diskstats: whole disks but no loop or memory devices, as host.disk.DISK.NAME.
void parseDiskstats(std::string_view text, MachineFigures& figures);

// /proc/meminfo: the amounts named in a table, in kilobytes, as host.meminfo.NAME.
void parseMeminfo(std::string_view text, MachineFigures& figures);

// /proc/loadavg: host.loadavg.1m, 5m and 15m.
void parseLoadavg(std::string_view text, MachineFigures& figures);

// /proc/pressure/RESOURCE: for some and full, the percentage of the last ten seconds as
// host.pressure.RESOURCE.some.avg10 and the stalled microseconds as
// host.pressure.RESOURCE.some.total.
void parsePressure(std::string_view resource, std::string_view text, MachineFigures& figures);

// /sys/class/thermal/thermal_zoneN/temp: host.thermal.N.celsius.
void parseTemperature(std::string_view zone, std::string_view text, MachineFigures& figures);

// All of these, of the files below `root` ("/" for this machine's); what isn't there is left out.
MachineFigures readMachineFigures(const std::string& root);

}  // namespace pelloran
