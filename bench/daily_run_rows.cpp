// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// A whole day on a device with everything, for each kind of storage controller, and what its steps
// take.

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <string>
#include <tuple>
#include <vector>

#include "NANDInfo/NANDInfo.h"
#include "NANDInfo/StructuredLogs.h"
#include "bench/Process.h"
#include "bench/ReportDevice.h"
#include "bench/Rows.h"
#include "daemon/DailyTelemetry.h"
#include "daemon/DataUsage.h"
#include "daemon/Tasking.h"
#include "host/Host.h"
#include "platform/CountersService.h"
#include "platform/ServitaLogs.h"
#include "platform/SystemLog.h"
#include "report/PLReport.h"

namespace bench {

namespace {

using platform::AllServices;

struct Day {
  const AllServices& platform;
  morvend::DeviceContext& context;
  std::int32_t number;
};

// The steps of the daily sequence, in its order; the telemetry's larger parts stand for themselves.
constexpr struct {
  const char* name;
  void (*run)(const Day&);
} kSteps[] = {
    {"counters checkpoint", [](const Day& day) { day.platform.counters.PLClientCheckpoint(); }},
    {"counters report",
     [](const Day& day) {
       std::ignore =
           report::PLReport(day.platform, day.context).writeLogForYesterday(day.number, nullptr);
     }},
    {"storage log and lists",
     [](const Day& day) { NANDInfo::DumpStorageStructuredLog(day.platform, false); }},
    {"storage health",
     [](const Day& day) {
       std::vector<platform::ScalarValue> values;
       const auto info = NANDInfo::CopyNANDInfoWithOptions(day.platform);
       for (const auto& [key, value] : *info) {
         if (const auto* number = value.as<plist::Number>()) {
           values.push_back({key, number->int64Value()});
         }
       }
       day.platform.counters.PLClientSetValuesForScalarKeys(values);
     }},
    {"data usage",
     [](const Day& day) {
       morvend::CollectDataUsage(day.platform.networkUsage, day.platform.counters,
                                 day.platform.preferences, day.platform.log);
     }},
    {"structured-log dump",
     [](const Day& day) { day.platform.faultwatch.dumpAllOldStructuredDataLogs(); }},
    {"tasking", [](const Day& day) { morvend::UpdateTaskingState(day.platform); }},
    {"support-log roll-over", [](const Day& day) { day.platform.servitaLogs.rollServitaLogs(); }},
};
constexpr std::size_t kNumber = std::size(kSteps);

double median(std::vector<double> values) {
  std::sort(values.begin(), values.end());
  return values[values.size() / 2];
}

// In this process, where names and tables are expanded once for all rounds.
void printSteps(const ReportDevice& device) {
  using Clock = std::chrono::steady_clock;
  std::vector<double> taken[kNumber + 2];
  for (int round = 0; round < 31; ++round) {
    device.forgetRuns();
    auto since = Clock::now();
    const auto lap = [&](std::size_t step) {
      const auto now = Clock::now();
      taken[step].push_back(std::chrono::duration<double, std::micro>(now - since).count());
      since = now;
    };
    {
      host::Host host({.root = device.path(), .lowestLevel = platform::LogLevel::error});
      lap(kNumber);
      for (std::size_t step = 0; step < kNumber; ++step) {
        kSteps[step].run({host.services(), host.context(), device.yesterday()});
        lap(step);
      }
    }
    lap(kNumber + 1);
  }
  std::printf("  of which, in one process:\n");
  for (std::size_t step = 0; step < kNumber + 2; ++step) {
    const char* name = step < kNumber    ? kSteps[step].name
                       : step == kNumber ? "making the host"
                                         : "ending the host";
    std::printf("    %-40s %8.0f us\n", name, median(taken[step]));
  }
}

}  // namespace

void addDailyRunRows(Table& table) {
  constexpr struct {
    const char* name;
    mkdevice::ControllerKind kind;
  } kControllers[] = {{"qrt3", mkdevice::ControllerKind::qrt3},
                      {"embedded", mkdevice::ControllerKind::embedded},
                      {"zmc", mkdevice::ControllerKind::zmc}};
  for (const auto& [name, kind] : kControllers) {
    ReportDevice device(5000, 1000, 100);
    device.addStorage(kind);
    table.compareFigures(
        std::string("-f, 5,000 keys and storage, ") + name, "the sum of its parts, bare", 1.3, "ns",
        [&] { return run(device.report()); }, [&] { return run(device.bareReport()); }, 31);
    if (kind != mkdevice::ControllerKind::qrt3) continue;
    table.compareFigures(
        "the same with qrt3, peak memory", "the sum of its parts, bare", 1.25, "KiB",
        [&] { return peakKiB(device.report()); }, [&] { return peakKiB(device.bareReport()); });
    printSteps(device);
  }
}

}  // namespace bench
