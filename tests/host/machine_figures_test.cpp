// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include <gtest/gtest.h>

#include <algorithm>
#include <fstream>
#include <map>
#include <optional>
#include <sstream>

#include "host/figures/DayFigures.h"
#include "host/figures/MachineFigures.h"
#include "host/files/DeviceRoot.h"
#include "support/TemporaryFolder.h"

namespace {

using host::figures::MachineFigures;

TEST(MachineFigures, SoundLinesOfFilesAreReadAndOthersSkipped) {
  const support::TemporaryFolder root;
  const std::pair<std::string, const char*> files[] = {
      {"proc/vmstat",
       "pgfault 12\nnr_free_pages 5\npswpin\npgpgin -1\noom_kill 1x\n\n"
       "pswpout 99999999999999999999999\npgmajfault 7"},
      {"proc/pressure/io",
       "some avg10=1.50 avg60=2 total=77\nfull avg10=inf total=-1\nall avg10=1\n"},
      {"proc/sys/kernel/random/boot_id", "b 1\n"},
      {"proc/uptime", "12.5 99\n"},
      {"sys/class/thermal/thermal_zone0/temp", "45500\n"},
      {"sys/class/thermal/thermal_zone1/temp", "hot\n"},
      {"sys/class/thermal/thermal_zone2/temp", ""},
      {"sys/class/thermal/thermal_zone30/temp", "-1500"},
      {"sys/class/thermal/thermal_zone4x/temp", "1"},
      {"sys/class/hwmon/hwmon0/name", "a chip"},
      {"sys/class/hwmon/hwmon0/temp2_input", "30000"},
      {"sys/class/hwmon/hwmon0/temp2_max", "90000"},
      {"sys/class/hwmon/hwmon0/temp_input", "1"},
      {"sys/class/hwmon/hwmon1/temp1_input", "1000"},
      {"sys/class/net/e0/device/uevent", "DRIVER=d"},
      {"sys/class/net/e0/statistics/rx_bytes", "5"},
      {"sys/class/net/e0/statistics/tx_errors", "-5"},
      {"sys/class/net/e0/statistics/multicast", "5"},
      {"sys/class/net/lo/statistics/rx_bytes", "6"},
  };
  for (const auto& [path, text] : files) root.write(path, text);
  MachineFigures figures;
  host::figures::addFiguresOfFiles(host::DeviceRoot(root.path().string()), figures);
  EXPECT_EQ(figures.counts, (decltype(figures.counts){{"host.vmstat.pgfault", 12},
                                                      {"host.vmstat.pswpout", INT64_MAX},
                                                      {"host.vmstat.pgmajfault", 7},
                                                      {"host.pressure.io.some.total", 77},
                                                      {"host.net.e0.rx_bytes", 5}}));
  EXPECT_EQ(figures.measurements,
            (decltype(figures.measurements){{"host.pressure.io.some.avg10", 1.5},
                                            {"host.thermal.0.celsius", 45.5},
                                            {"host.thermal.30.celsius", -1.5},
                                            {"host.sensor.a_chip.2.celsius", 30}}));
  EXPECT_EQ(figures.boot, "b_1");
  EXPECT_EQ(figures.uptime, 12.5);
}

// Within a boot every total is counted once, whatever comes in between.
TEST(DayFigures, WhatATotalHasGrownByIsCountedOnce) {
  using Counts = decltype(MachineFigures::counts);
  const std::string disk = "host.disk.a.sectors_read", rate = "host.disk.a.read_bytes_per_second";
  const struct {
    const char* boot;
    double uptime;
    Counts totals, additions;
    std::optional<double> throughput;
  } readings[] = {
      {"1", 10, {{disk, 1000}}, {{disk, 0}}, {}},
      {"1", 20, {{disk, 1020}}, {{disk, 20}}, 1024},
      {"1", 20, {{disk, 1020}, {"new", 7}}, {{disk, 0}, {"new", 7}}, {}},
      {"1", 30, {{"new", 8}}, {{"new", 1}}, {}},
      {"1", 40, {{disk, 1040}}, {{disk, 20}}, 512 * 20 / 10.0},
      {"1", 50, {{disk, 10}}, {{disk, 10}}, 512},
      {"2", 5, {{disk, 2000}, {"new", INT64_MAX}}, {{disk, 2000}, {"new", INT64_MAX}}, 204800},
      {"2", 6, {{"new", INT64_MAX}}, {{"new", 0}}, {}},
  };
  std::string remembered;
  for (const auto& reading : readings) {
    const auto day = host::figures::dayFigures(
        remembered, {reading.boot, reading.uptime, reading.totals, {{"gauge", -1.5}}});
    EXPECT_EQ(day.additions, reading.additions) << reading.uptime;
    decltype(day.samples) samples;
    if (reading.throughput) samples.emplace_back(rate, *reading.throughput);
    samples.emplace_back("gauge", -1.5);
    EXPECT_EQ(day.samples, samples) << reading.uptime;
    remembered = day.remembered;
  }
  // What isn't a reading is none.
  for (const char* text : {"2", "2 x\n", "2 6\n-1 new\n", "2 6\n5\n"}) {
    EXPECT_EQ(host::figures::dayFigures(text, {"2", 7, {{"new", 9}}, {}}).additions,
              (Counts{{"new", 0}}))
        << text;
  }
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
