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
  table.compare(
      "start and end, unknown option", "empty program, same libraries", 1.5, 1,
      [&] { run(unknown); }, [&] { run(empty); }, 101);
  table.compare(
      "-d with the gate closed", "empty program, same libraries", 2, 1, [&] { run(gated); },
      [&] { run(empty); }, 101);
  table.compareFigures(
      "-d with the gate closed, peak memory", "empty program, same libraries", 1.5, "KiB",
      [&] { return peakKiB(gated); }, [&] { return peakKiB(empty); });

  support::writeController(root);
  const Arguments statistics{program("nandinfo"), "ftl", "--round"};
  table.compare(
      "nandinfo ftl, every counter", "empty program, same libraries", 3, 1,
      [&] { run(statistics); }, [&] { run(empty); }, 101);
}

void addReportRows(Table& table, const std::string& size, const ReportDevice& device, int rounds) {
  table.compareFigures(
      "-f, " + size, "the sum of its parts, bare", 1.6, "ns", [&] { return run(device.report()); },
      [&] { return run(device.bareReport()); }, rounds);
  table.compareFigures(
      "-f, " + size, "the same job in Python", 0.1, "ns", [&] { return run(device.report()); },
      [&] { return run(device.pythonReport()); }, 7);
}

}  // namespace

void addProcessRows(Table& table) {
  addStartRows(table);
  addReportRows(table, "5,000 keys, 1,000 x 100 samples", ReportDevice(5000, 1000, 100), 31);
  addReportRows(table, "50,000 keys, 1,000 x 1,000 samples", ReportDevice(50000, 1000, 1000), 15);
}

}  // namespace bench
