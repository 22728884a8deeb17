// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include <gtest/gtest.h>

#include <algorithm>
#include <fstream>
#include <map>
#include <sstream>

#include "host/figures/MachineFigures.h"
#include "support/TemporaryFolder.h"

namespace {

using host::figures::MachineFigures;

TEST(MachineFigures, SoundLinesOfFilesAreReadAndOthersSkipped) {
  const support::TemporaryFolder root;
  root.write("proc/vmstat",
             "pgfault 12\nnr_free_pages 5\npswpin\npgpgin -1\noom_kill 1x\n\n"
             "pswpout 99999999999999999999999\npgmajfault 7");
  root.write("proc/pressure/io",
             "some avg10=1.50 avg60=2 total=77\nfull avg10=inf total=-1\nall avg10=1\n");
  for (const auto& [zone, text] :
       {std::pair("0", "45500\n"), {"1", "hot\n"}, {"2", ""}, {"30", "-1500"}, {"4x", "1"}}) {
    root.write(std::string("sys/class/thermal/thermal_zone") + zone + "/temp", text);
  }
  MachineFigures figures;
  host::figures::addFiguresOfFiles(root.path(), figures);
  EXPECT_EQ(figures.counts, (decltype(figures.counts){{"host.vmstat.pgfault", 12},
                                                      {"host.vmstat.pswpout", INT64_MAX},
                                                      {"host.vmstat.pgmajfault", 7},
                                                      {"host.pressure.io.some.total", 77}}));
  std::ranges::sort(figures.measurements);  // the zones come as the folder has them
  EXPECT_EQ(figures.measurements,
            (decltype(figures.measurements){{"host.pressure.io.some.avg10", 1.5},
                                            {"host.thermal.0.celsius", 45.5},
                                            {"host.thermal.30.celsius", -1.5}}));
}

// What the kernel's own files say, under the figures' keys.
std::map<std::string, double> figuresOfKernel() {
  std::map<std::string, double> figures;
  std::string name, word;
  double value = 0;
  for (std::ifstream file("/proc/meminfo"); std::getline(file, name, ':') >> value;) {
    figures["host.meminfo." + name] = value;
    std::getline(file, word);
  }
  const std::map<int, const char*> columns = {
      {1, "reads"},           {3, "sectors_read"}, {4, "read_ms"},  {5, "writes"},
      {7, "sectors_written"}, {8, "write_ms"},     {10, "busy_ms"},
  };
  std::ifstream disks("/proc/diskstats");
  for (std::string line; std::getline(disks, line);) {
    std::istringstream words(line);
    words >> word >> word >> name;
    for (int column = 1; words >> value; ++column) {
      if (columns.contains(column)) {
        figures["host.disk." + name + "." + columns.at(column)] = value;
      }
    }
  }
  return figures;
}

// A figure under another's key. They change while one looks: those of disks grow, those of memory
// go up and down by less than the twentieth part of all.
TEST(MachineFigures, OfDisksAndMemoryAreTheKernels) {
  const auto before = figuresOfKernel();
  MachineFigures figures = host::figures::readMachineFigures();
  const auto after = figuresOfKernel();
  figures.measurements.insert(figures.measurements.end(), figures.counts.begin(),
                              figures.counts.end());
  int compared = 0;
  for (const auto& [key, value] : figures.measurements) {
    const bool ofMemory = key.starts_with("host.meminfo.");
    if (!ofMemory && !key.starts_with("host.disk.")) continue;
    ASSERT_TRUE(before.contains(key) && after.contains(key)) << key;
    const auto [low, high] = std::minmax(before.at(key), after.at(key));
    const double slack = ofMemory ? before.at("host.meminfo.MemTotal") / 20 : 0;
    EXPECT_TRUE(low - slack <= value && value <= high + slack) << key << " " << value;
    ++compared;
  }
  EXPECT_GE(compared, 14);
}

}  // namespace
