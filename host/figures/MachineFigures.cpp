// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/figures/MachineFigures.h"

#include <libproc2/diskstats.h>
#include <libproc2/meminfo.h>
#include <libproc2/misc.h>

#include <algorithm>
#include <charconv>
#include <cmath>
#include <cstdint>
#include <initializer_list>
#include <iterator>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <system_error>
#include <utility>
#include <vector>

#include "host/machine/SourceFiles.h"

namespace host::figures {

using machine::countIn;
using machine::takeUntil;
using machine::takeWord;

namespace {

constexpr std::string_view kVmstatEvents[] = {"pgpgin",
                                              "pgpgout",
                                              "pswpin",
                                              "pswpout",
                                              "pgfault",
                                              "pgmajfault",
                                              "pgfree",
                                              "pgactivate",
                                              "pgdeactivate",
                                              "pgrefill",
                                              "pgreuse",
                                              "pgsteal_kswapd",
                                              "pgsteal_direct",
                                              "pgscan_kswapd",
                                              "pgscan_direct",
                                              "kswapd_inodesteal",
                                              "pageoutrun",
                                              "allocstall_normal",
                                              "allocstall_movable",
                                              "compact_stall",
                                              "compact_success",
                                              "compact_fail",
                                              "oom_kill",
                                              "nr_dirtied",
                                              "nr_written",
                                              "workingset_refault_anon",
                                              "workingset_refault_file",
                                              "drop_pagecache",
                                              "drop_slab"};

constexpr struct {
  meminfo_item item;
  std::string_view name;
} kMeminfoAmounts[] = {
    {MEMINFO_MEM_FREE, "MemFree"},        {MEMINFO_MEM_AVAILABLE, "MemAvailable"},
    {MEMINFO_MEM_BUFFERS, "Buffers"},     {MEMINFO_MEM_CACHED, "Cached"},
    {MEMINFO_SWAP_CACHED, "SwapCached"},  {MEMINFO_MEM_ACTIVE, "Active"},
    {MEMINFO_MEM_INACTIVE, "Inactive"},   {MEMINFO_MEM_DIRTY, "Dirty"},
    {MEMINFO_MEM_WRITEBACK, "Writeback"}, {MEMINFO_MEM_ANON, "AnonPages"},
    {MEMINFO_MEM_MAPPED, "Mapped"},       {MEMINFO_MEM_SHARED, "Shmem"},
    {MEMINFO_MEM_SLAB, "Slab"},           {MEMINFO_SWAP_FREE, "SwapFree"}};

constexpr struct {
  diskstats_item item;
  std::string_view name;
} kDiskCounts[] = {{DISKSTATS_READS, "reads"},
                   {DISKSTATS_READ_SECTORS, "sectors_read"},
                   {DISKSTATS_READ_TIME, "read_ms"},
                   {DISKSTATS_WRITES, "writes"},
                   {DISKSTATS_WRITE_SECTORS, "sectors_written"},
                   {DISKSTATS_WRITE_TIME, "write_ms"},
                   {DISKSTATS_IO_TIME, "busy_ms"}};

std::optional<std::int64_t> count(std::string_view word) {
  const auto value = countIn(word);
  if (!value) return std::nullopt;
  return static_cast<std::int64_t>(std::min<std::uint64_t>(*value, INT64_MAX));
}

std::optional<double> measurement(std::string_view word) {
  double value = 0;
  const auto [end, error] = std::from_chars(word.data(), word.data() + word.size(), value);
  if (error != std::errc() || end != word.data() + word.size() || !std::isfinite(value)) {
    return std::nullopt;
  }
  return value;
}

// The number of a name that is a prefix, a number and a suffix; empty when it is none.
std::string_view numberIn(std::string_view name, std::string_view prefix,
                          std::string_view suffix = "") {
  if (!name.starts_with(prefix) || !name.ends_with(suffix) ||
      name.size() <= prefix.size() + suffix.size()) {
    return {};
  }
  name = name.substr(prefix.size(), name.size() - prefix.size() - suffix.size());
  return name.find_first_not_of("0123456789") == name.npos ? name : std::string_view();
}

std::string key(std::initializer_list<std::string_view> parts) {
  std::string text = "host";
  for (const std::string_view part : parts) text.append(".").append(part);
  return text;
}

constexpr const char* kNetworkCounts[] = {"rx_bytes",  "tx_bytes",  "rx_packets", "tx_packets",
                                          "rx_errors", "tx_errors", "rx_dropped", "tx_dropped"};

// Ends what libproc2 has read.
template <auto unref>
struct Unref {
  template <typename Info>
  void operator()(Info* info) const {
    unref(&info);
  }
};

void addDisks(MachineFigures& figures) {
  diskstats_info* info = nullptr;
  if (procps_diskstats_new(&info) < 0) return;
  const std::unique_ptr<diskstats_info, Unref<procps_diskstats_unref>> owned(info);
  std::vector<diskstats_item> items = {DISKSTATS_NAME, DISKSTATS_TYPE};
  for (const auto& row : kDiskCounts) items.push_back(row.item);
  const auto* reaped = procps_diskstats_reap(info, items.data(), static_cast<int>(items.size()));
  if (reaped == nullptr) return;
  for (int i = 0; i < reaped->total; ++i) {
    const diskstats_result* value = reaped->stacks[i]->head;  // one for each item
    const std::string_view disk = value++->result.str;
    const bool isWhole = value++->result.s_int == DISKSTATS_TYPE_DISK;
    const bool isMemory =
        disk.starts_with("loop") || disk.starts_with("ram") || disk.starts_with("zram");
    if (!isWhole || isMemory) continue;
    for (const auto& row : kDiskCounts) {
      const std::uint64_t count = std::min<std::uint64_t>(value++->result.ul_int, INT64_MAX);
      figures.counts.emplace_back(key({"disk", machine::inKey(disk), row.name}),
                                  static_cast<std::int64_t>(count));
    }
  }
}

void addMemory(MachineFigures& figures) {
  meminfo_info* info = nullptr;
  if (procps_meminfo_new(&info) < 0) return;
  const std::unique_ptr<meminfo_info, Unref<procps_meminfo_unref>> owned(info);
  for (const auto& [item, name] : kMeminfoAmounts) {
    const meminfo_result* amount = procps_meminfo_get(info, item);
    if (amount == nullptr) continue;
    figures.measurements.emplace_back(key({"meminfo", name}),
                                      static_cast<double>(amount->result.ul_int));
  }
}

void addLoad(MachineFigures& figures) {
  double one = 0, five = 0, fifteen = 0;
  if (procps_loadavg(&one, &five, &fifteen) < 0) return;
  figures.measurements.insert(
      figures.measurements.end(),
      {{"host.loadavg.1m", one}, {"host.loadavg.5m", five}, {"host.loadavg.15m", fifteen}});
}

void addVmstat(std::string_view text, MachineFigures& figures) {
  while (!text.empty()) {
    std::string_view line = takeUntil(text, '\n');
    const std::string_view name = takeWord(line);
    const auto value = count(takeWord(line));
    if (value && std::ranges::find(kVmstatEvents, name) != std::end(kVmstatEvents)) {
      figures.counts.emplace_back(key({"vmstat", name}), *value);
    }
  }
}

void addPressure(std::string_view resource, std::string_view text, MachineFigures& figures) {
  while (!text.empty()) {
    std::string_view line = takeUntil(text, '\n');
    const std::string_view share = takeWord(line);
    if (share != "some" && share != "full") continue;
    for (std::string_view word = takeWord(line); !word.empty(); word = takeWord(line)) {
      const std::string_view name = takeUntil(word, '=');
      if (name == "avg10") {
        if (const auto value = measurement(word)) {
          figures.measurements.emplace_back(key({"pressure", resource, share, name}), *value);
        }
      } else if (name == "total") {
        if (const auto value = count(word)) {
          figures.counts.emplace_back(key({"pressure", resource, share, name}), *value);
        }
      }
    }
  }
}

void addNetwork(const DeviceRoot& files, MachineFigures& figures) {
  for (const auto& [path, name] : machine::sourceDevices(files, "/sys/class/net")) {
    if (machine::driverOf(files, path + "/device").empty()) continue;
    for (const char* counter : kNetworkCounts) {
      const auto value = machine::sourceLine(files, path + "/statistics/" + counter);
      if (const auto number = value ? count(*value) : std::nullopt) {
        figures.counts.emplace_back(key({"net", name, counter}), *number);
      }
    }
  }
}

// A temperature in thousandths of a degree.
void addTemperature(const DeviceRoot& files, const std::string& path, std::string name,
                    MachineFigures& figures) {
  const auto line = machine::sourceLine(files, path);
  const auto thousandths = line ? measurement(*line) : std::nullopt;
  if (thousandths) figures.measurements.emplace_back(std::move(name), *thousandths / 1000);
}

void addTemperatures(const DeviceRoot& files, MachineFigures& figures) {
  for (const auto& [path, name] : machine::sourceDevices(files, "/sys/class/thermal")) {
    const std::string_view zone = numberIn(name, "thermal_zone");
    if (zone.empty()) continue;
    addTemperature(files, path + "/temp", key({"thermal", zone, "celsius"}), figures);
  }
  for (const auto& [path, device] : machine::sourceDevices(files, "/sys/class/hwmon")) {
    const auto chip = machine::sourceLine(files, path + "/name");
    if (!chip) continue;
    for (const auto& [input, name] : machine::sourceDevices(files, path)) {
      const std::string_view sensor = numberIn(name, "temp", "_input");
      if (sensor.empty()) continue;
      addTemperature(files, input, key({"sensor", machine::inKey(*chip), sensor, "celsius"}),
                     figures);
    }
  }
}

// The boot that the counts are of, and how long ago it was.
void addBoot(const DeviceRoot& files, MachineFigures& figures) {
  const auto boot = machine::sourceLine(files, "/proc/sys/kernel/random/boot_id");
  figures.boot = machine::inKey(boot.value_or(""));
  const auto line = machine::sourceLine(files, "/proc/uptime");
  std::string_view words = line ? *line : std::string_view();
  figures.uptime = measurement(takeWord(words)).value_or(0);
}

}  // namespace

void addFiguresOfFiles(const DeviceRoot& files, MachineFigures& figures) {
  addBoot(files, figures);
  addVmstat(machine::sourceText(files, "/proc/vmstat").value_or(""), figures);
  for (const char* resource : {"cpu", "io", "memory", "irq"}) {
    addPressure(resource,
                machine::sourceText(files, std::string("/proc/pressure/") + resource).value_or(""),
                figures);
  }
  addNetwork(files, figures);
  addTemperatures(files, figures);
}

MachineFigures readMachineFigures() {
  MachineFigures figures;
  addFiguresOfFiles(DeviceRoot("/"), figures);
  addDisks(figures);
  addMemory(figures);
  addLoad(figures);
  return figures;
}

}  // namespace host::figures
