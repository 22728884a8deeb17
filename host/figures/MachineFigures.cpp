// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/figures/MachineFigures.h"

#include <libproc2/diskstats.h>
#include <libproc2/meminfo.h>
#include <libproc2/misc.h>

#include <algorithm>
#include <charconv>
#include <cmath>
#include <filesystem>
#include <fstream>
#include <initializer_list>
#include <iterator>
#include <limits>
#include <memory>
#include <optional>
#include <string_view>
#include <system_error>

namespace host::figures {

namespace {

constexpr std::size_t kMaxFileSize = std::size_t{1} << 20;

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

// Takes what stands before the separator, and the separator, off the text's front.
std::string_view take(std::string_view& text, char separator) {
  const auto end = std::min(text.find(separator), text.size());
  const std::string_view part = text.substr(0, end);
  text.remove_prefix(std::min(end + 1, text.size()));
  return part;
}

std::string_view takeWord(std::string_view& line) {
  line.remove_prefix(std::min(line.find_first_not_of(" \t"), line.size()));
  const auto end = std::min(line.find_first_of(" \t"), line.size());
  const std::string_view word = line.substr(0, end);
  line.remove_prefix(end);
  return word;
}

std::optional<std::int64_t> integer(std::string_view word) {
  std::int64_t value = 0;
  const auto [end, error] = std::from_chars(word.data(), word.data() + word.size(), value);
  if (word.empty() || end != word.data() + word.size()) return std::nullopt;
  if (error == std::errc::result_out_of_range) {
    return word.front() == '-' ? std::numeric_limits<std::int64_t>::min()
                               : std::numeric_limits<std::int64_t>::max();
  }
  return error == std::errc() ? std::optional(value) : std::nullopt;
}

std::optional<std::int64_t> count(std::string_view word) {
  const auto value = integer(word);
  return value && *value >= 0 ? value : std::nullopt;
}

std::optional<double> measurement(std::string_view word) {
  double value = 0;
  const auto [end, error] = std::from_chars(word.data(), word.data() + word.size(), value);
  if (error != std::errc() || end != word.data() + word.size() || !std::isfinite(value)) {
    return std::nullopt;
  }
  return value;
}

bool isNumber(std::string_view text) {
  return !text.empty() && text.find_first_not_of("0123456789") == std::string_view::npos;
}

std::string key(std::initializer_list<std::string_view> parts) {
  std::string text = "host";
  for (const std::string_view part : parts) text.append(".").append(part);
  return text;
}

std::string fileText(const std::filesystem::path& path) {
  std::ifstream file(path, std::ios::binary);
  std::string text(kMaxFileSize, '\0');
  file.read(text.data(), static_cast<std::streamsize>(text.size()));
  text.resize(static_cast<std::size_t>(file.gcount()));
  return text;
}

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
      figures.counts.emplace_back(key({"disk", disk, row.name}), static_cast<std::int64_t>(count));
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
    std::string_view line = take(text, '\n');
    const std::string_view name = takeWord(line);
    const auto value = count(takeWord(line));
    if (value && std::ranges::find(kVmstatEvents, name) != std::end(kVmstatEvents)) {
      figures.counts.emplace_back(key({"vmstat", name}), *value);
    }
  }
}

void addPressure(std::string_view resource, std::string_view text, MachineFigures& figures) {
  while (!text.empty()) {
    std::string_view line = take(text, '\n');
    const std::string_view share = takeWord(line);
    if (share != "some" && share != "full") continue;
    for (std::string_view word = takeWord(line); !word.empty(); word = takeWord(line)) {
      const std::string_view name = take(word, '=');
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

void addTemperature(std::string_view zone, std::string_view text, MachineFigures& figures) {
  if (const auto thousandths = integer(take(text, '\n'))) {
    figures.measurements.emplace_back(key({"thermal", zone, "celsius"}),
                                      static_cast<double>(*thousandths) / 1000);
  }
}

}  // namespace

void addFiguresOfFiles(const std::string& root, MachineFigures& figures) {
  const std::filesystem::path proc = std::filesystem::path(root) / "proc";
  addVmstat(fileText(proc / "vmstat"), figures);
  for (const char* resource : {"cpu", "io", "memory"}) {
    addPressure(resource, fileText(proc / "pressure" / resource), figures);
  }
  constexpr std::string_view kPrefix = "thermal_zone";
  std::error_code error;
  std::filesystem::directory_iterator zone(
      std::filesystem::path(root) / "sys" / "class" / "thermal", error);
  for (; !error && zone != std::filesystem::directory_iterator(); zone.increment(error)) {
    const std::string name = zone->path().filename().string();
    if (!name.starts_with(kPrefix) || !isNumber(name.substr(kPrefix.size()))) continue;
    addTemperature(name.substr(kPrefix.size()), fileText(zone->path() / "temp"), figures);
  }
}

MachineFigures readMachineFigures() {
  MachineFigures figures;
  addFiguresOfFiles("/", figures);
  addDisks(figures);
  addMemory(figures);
  addLoad(figures);
  return figures;
}

}  // namespace host::figures
