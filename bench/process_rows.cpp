// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// morvend as a whole process: its start, the closed gate, and whole reports of two sizes.

#include <cstdlib>

#include "bench/Process.h"
#include "bench/ReportDevice.h"
#include "bench/Rows.h"
#include "support/ControllerRoot.h"
#include "support/TemporaryFolder.h"

namespace bench {

namespace {

void addStartRows(Table& table) {
  const support::TemporaryFolder root;
  ::setenv("MORVEND_ROOT", root.path().c_str(), 1);
  const Arguments empty{program("empty_program")}, unknown{program("morvend"), "-unknown"},
      gated{program("morvend"), "-d"};
  run(gated);  // closes the gate
  const auto add = [&](const char* what, double goal, const Arguments& arguments) {
    table.compareFigures(
        what, "empty program, same libraries", goal, "ns", [&] { return run(arguments); },
        [&] { return run(empty); }, 101);
  };
  add("start and end, unknown option", 1.15, unknown);
  add("-d with the gate closed", 2, gated);
  table.compareFigures(
      "-d with the gate closed, peak memory", "empty program, same libraries", 1.5, "KiB",
      [&] { return peakKiB(gated); }, [&] { return peakKiB(empty); });

  support::writeController(root);
  add("nandinfo ftl, every counter", 3, {program("nandinfo"), "ftl", "--round"});
}

void addReportRows(Table& table, const std::string& size, const ReportDevice& device, double goal,
                   int rounds) {
  table.compareFigures(
      "-f, " + size, "the sum of its parts, bare", goal, "ns", [&] { return run(device.report()); },
      [&] { return run(device.bareReport()); }, rounds);
  table.compareFigures(
      "-f, " + size, "the same job in Python", 0.085, "ns", [&] { return run(device.report()); },
      [&] { return run(device.pythonReport()); }, 7);
}

}  // namespace

void addProcessRows(Table& table) {
  addStartRows(table);
  addReportRows(table, "5,000 keys, 1,000 x 100 samples", ReportDevice(5000, 1000, 100), 1.4, 31);
  addReportRows(table, "50,000 keys, 1,000 x 1,000 samples", ReportDevice(50000, 1000, 1000), 1.3,
                15);
}

}  // namespace bench
