// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// group, section, key or prefix, options
#include "tools/mkdevice/Vocabulary.h"

namespace mkdevice {

namespace {

using enum Group;
using enum Section;

constexpr double kLoad[] = {0.25, 0.5, 1, 2, 4, 8};
constexpr double kDecibels[] = {-120, -110, -100, -90, -80, -70};
constexpr double kStalledPercent[] = {0, 1, 5, 10, 25, 50};

// clang-format off
constexpr WhitelistRow kEntries[] = {
    // Families of counters. Of two prefixes that match, the longer one wins.
    {radio, scalarPrefixes, "com.norba.radio.cell.", {.significantFigures = 2}},
    {radio, scalarPrefixes, "com.norba.radio.cell.band", {.bucketInterval = 60}},
    {radio, scalarPrefixes, "com.norba.radio.cell.calls", {}},
    {radio, distributionPrefixes, "com.norba.radio.cell.", {}},
    {radio, distributionPrefixes, "com.norba.radio.cell.signal", {.intervals = kDecibels}},
    {system, scalarPrefixes, "com.norba.applications.foreground.", {.bucketInterval = 10}},

    // What the report collects itself.
    {system, scalarKeys, "com.norba.tarvenn.numAllInstalledApps", {.bucketInterval = 5}},
    {system, scalarKeys, "com.norba.tarvenn.numThirdPartyApps", {.bucketInterval = 5}},
    {storage, scalarKeys, "com.norba.quenset.prnd.database.size", {}},
    {storage, scalarKeys, "com.norba.quenset.prnd.database.corruptions", {}},
    {system, scalarKeys, "com.norba.usage.cur_boot_session_cpu_uptime", {.bucketInterval = 60}},
    {system, scalarPrefixes, "com.norba.kernel.vmtc_", {}},
    {system, scalarKeys, "com.norba.kernel.memorystatus_freeze_count", {}},
    {system, scalarKeys, "com.norba.kernel.memorystatus_freeze_pageouts", {.significantFigures = 3}},
    {system, scalarKeys, "com.norba.kernel.memorystatus_freeze_budget_pages_remaining", {.significantFigures = 2}},
    {system, scalarKeys, "com.norba.kernel.memorystatus_thaw_count", {}},
    {system, scalarKeys, "com.norba.kernel.swapusage", {.bucketInterval = 1 << 20, .significantFigures = 3}},
    {system, scalarPrefixes, "com.norba.memorystatus_freezer_", {}},
    {system, scalarKeys, "com.norba.memorystatus_freezer_refreeze_average", {.significantFigures = 2}},

    // What the telemetry of a day collects; of the network's users only the system's own.
    {storage, scalarKeys, "com.norba.tarvenn.DiskUsageUserTotalBlocks", {.bucketInterval = 1024}},
    {storage, scalarKeys, "com.norba.tarvenn.DiskUsageUserBlocksFree", {.bucketInterval = 1024}},
    {storage, scalarPrefixes, "com.norba.NANDInfo.Num", {.significantFigures = 3}},
    {system, scalarPrefixes, "com.norba.velquist.", {.significantFigures = 2}},
    {radio, scalarPrefixes, "datausage.wifiInKB.com.norba.", {.significantFigures = 2}},
    {radio, scalarPrefixes, "datausage.wifiOutKB.com.norba.", {.significantFigures = 2}},
    {radio, scalarPrefixes, "datausage.wwanInKB.com.norba.", {.significantFigures = 2}},
    {radio, scalarPrefixes, "datausage.wwanOutKB.com.norba.", {.significantFigures = 2}},
    {radio, scalarPrefixes, "datausage.olddata.com.norba.", {}},
    {radio, scalarPrefixes, "datausage.baddata.com.norba.", {}},

    // Some of this machine's own figures.
    {machine, scalarPrefixes, "host.vmstat.", {.significantFigures = 3}},
    {machine, scalarPrefixes, "host.vmstat.pg", {.significantFigures = 2}},
    {machine, scalarPrefixes, "host.disk.", {.bucketInterval = 100}},
    {machine, distributionKeys, "host.loadavg.1m", {.intervals = kLoad}},
    {machine, distributionPrefixes, "host.meminfo.", {}},
    {machine, distributionPrefixes, "host.pressure.", {.intervals = kStalledPercent}},

    // Internal devices report these as they are.
    {internalTesting, scalarKeys, "com.norba.battery.discharge_mah", {}},
    {internalTesting, scalarKeys, "com.norba.storage.written_mib", {}},
    {internalTesting, distributionPrefixes, "com.norba.internal.", {}},
    {internalTesting, scalarPrefixes, "com.norba.internal.", {}},
};
// clang-format on

}  // namespace

std::span<const WhitelistRow> whitelistTable() { return kEntries; }

}  // namespace mkdevice
