#include <gtest/gtest.h>

#include <algorithm>
#include <fstream>
#include <map>
#include <sstream>

#include "host/machine/MachineFigures.h"
#include "support/TemporaryFolder.h"

namespace {

using host::machine::MachineFigures;

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
  host::machine::addFiguresOfFiles(root.path(), figures);
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

// A figure under another's key: one that is the same before and after is compared, until each has
// been, which takes many looks at a busy machine.
TEST(MachineFigures, OfDisksAndMemoryAreTheKernels) {
  std::map<std::string, bool> compared;
  const auto isDone = [&] {
    return !compared.empty() &&
           std::ranges::all_of(compared, [](const auto& row) { return row.second; });
  };
  for (int looks = 0; looks < 1000 && !isDone(); ++looks) {
    const auto before = figuresOfKernel();
    MachineFigures figures = host::machine::readMachineFigures();
    const auto after = figuresOfKernel();
    figures.measurements.insert(figures.measurements.end(), figures.counts.begin(),
                                figures.counts.end());
    for (const auto& [key, value] : figures.measurements) {
      if (!key.starts_with("host.meminfo.") && !key.starts_with("host.disk.")) continue;
      ASSERT_TRUE(before.contains(key)) << key;
      const bool isStill = before.at(key) == after.at(key);
      EXPECT_TRUE(!isStill || value == before.at(key)) << key << " " << value;
      compared[key] |= isStill;
    }
  }
  EXPECT_GE(compared.size(), 14u);
  for (const auto& [key, was] : compared) EXPECT_TRUE(was) << key;
}

}  // namespace
