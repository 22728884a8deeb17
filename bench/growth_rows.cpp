// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// How the cost of a day grows with its counters: the sample device with 1, 10 and 100 times its
// counters.

#include <cstdlib>
#include <stdexcept>
#include <string>

#include "base/CivilDate.h"
#include "bench/Process.h"
#include "bench/ReportDevice.h"
#include "bench/Rows.h"
#include "host/process/SystemClock.h"
#include "support/TemporaryFolder.h"
#include "tools/mkdevice/DeviceMaker.h"
#include "tools/mkdevice/Vocabulary.h"

namespace bench {

namespace {

class SampleDevice {
 public:
  explicit SampleDevice(int scale)
      : counters_(static_cast<double>(mkdevice::scalarTable().size() +
                                      mkdevice::distributionTable().size()) *
                  scale) {
    const std::int32_t today = base::dayNumber(host::SystemClock().now().secondsSince1970);
    const auto made = mkdevice::makeDevice({.folder = folder_.path(),
                                            .sample = {.scale = scale, .today = today},
                                            .module = FAULTWATCH_SUPPORT_MODULE},
                                           {[](const auto&) {}, [](const auto&) {}});
    if (!made) throw std::runtime_error(made.error().text);
  }

  double counters() const { return counters_; }

  // A run as if it were the first of the day.
  Arguments run() const {
    forgetLogs(folder_);
    ::setenv("MORVEND_ROOT", folder_.path().c_str(), 1);
    return {program("morvend"), "-f"};
  }

 private:
  support::TemporaryFolder folder_;
  double counters_;
};

}  // namespace

void addGrowthRows(Table& table) {
  const SampleDevice one(1), ten(10), hundred(100);
  const auto add = [&](const SampleDevice& more, const SampleDevice& less, const std::string& what,
                       const std::string& against) {
    const auto perCounter = [](const SampleDevice& device, double (*figure)(Arguments)) {
      return [&device, figure] { return figure(device.run()) / device.counters(); };
    };
    constexpr auto time = [](Arguments arguments) { return bench::run(arguments); };
    table.compareFigures("-f, " + what + ", a counter", against, 1.0, "ns", perCounter(more, time),
                         perCounter(less, time));
    table.compareFigures("-f, " + what + ", a counter's memory", against, 1.0, "KiB",
                         perCounter(more, peakKiB), perCounter(less, peakKiB), 5);
  };
  add(ten, one, "the sample's counters x 10", "with the sample's counters");
  add(hundred, ten, "the sample's counters x 100", "with ten times the sample's counters");
}

}  // namespace bench
