#include "tools/pelloran/MachineFigures.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <cmath>
#include <filesystem>
#include <fstream>
#include <limits>
#include <optional>

namespace pelloran {

namespace {

constexpr std::size_t kLongestFile = std::size_t{1} << 20;

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

constexpr std::string_view kMeminfoAmounts[] = {
    "MemFree", "MemAvailable", "Buffers",   "Cached", "SwapCached", "Active", "Inactive",
    "Dirty",   "Writeback",    "AnonPages", "Mapped", "Shmem",      "Slab",   "SwapFree"};

// The columns of a disk behind its name.
constexpr std::string_view kDiskCounts[] = {"reads",           "",                        // merged
                                            "sectors_read",    "read_ms",  "writes", "",  // merged
                                            "sectors_written", "write_ms", "",  // in progress
                                            "busy_ms"};

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

template <typename Table>
bool isIn(const Table& table, std::string_view name) {
  return std::find(std::begin(table), std::end(table), name) != std::end(table);
}

bool isNumber(std::string_view text) {
  return !text.empty() && text.find_first_not_of("0123456789") == std::string_view::npos;
}

// sda1 is a partition of sda, nvme0n1p1 one of nvme0n1.
bool isPartition(std::string_view name, std::string_view disk) {
  if (disk.empty() || !name.starts_with(disk)) return false;
  std::string_view rest = name.substr(disk.size());
  if (isNumber(disk.substr(disk.size() - 1))) {
    if (!rest.starts_with('p')) return false;
    rest.remove_prefix(1);
  }
  return isNumber(rest);
}

std::string key(std::initializer_list<std::string_view> parts) {
  std::string text = "host";
  for (const std::string_view part : parts) text.append(".").append(part);
  return text;
}

std::string fileText(const std::filesystem::path& path) {
  std::ifstream file(path, std::ios::binary);
  std::string text(kLongestFile, '\0');
  file.read(text.data(), static_cast<std::streamsize>(text.size()));
  text.resize(static_cast<std::size_t>(file.gcount()));
  return text;
}

}  // namespace

void parseVmstat(std::string_view text, MachineFigures& figures) {
  while (!text.empty()) {
    std::string_view line = take(text, '\n');
    const std::string_view name = takeWord(line);
    const auto value = count(takeWord(line));
    if (value && isIn(kVmstatEvents, name)) {
      figures.counts.emplace_back(key({"vmstat", name}), *value);
    }
  }
}

void parseDiskstats(std::string_view text, MachineFigures& figures) {
  struct Disk {
    std::string_view name;
    std::array<std::optional<std::int64_t>, std::size(kDiskCounts)> counts;
  };
  std::vector<Disk> disks;
  while (!text.empty()) {
    std::string_view line = take(text, '\n');
    takeWord(line);  // major and minor number
    takeWord(line);
    Disk disk{takeWord(line), {}};
    for (auto& value : disk.counts) value = count(takeWord(line));
    const bool counted = disk.counts.back().has_value();
    const bool memory = disk.name.starts_with("loop") || disk.name.starts_with("ram") ||
                        disk.name.starts_with("zram");
    if (counted && !memory) disks.push_back(disk);
  }
  for (const Disk& disk : disks) {
    if (std::any_of(disks.begin(), disks.end(),
                    [&](const Disk& other) { return isPartition(disk.name, other.name); })) {
      continue;
    }
    for (std::size_t i = 0; i < disk.counts.size(); ++i) {
      if (!kDiskCounts[i].empty() && disk.counts[i]) {
        figures.counts.emplace_back(key({"disk", disk.name, kDiskCounts[i]}), *disk.counts[i]);
      }
    }
  }
}

void parseMeminfo(std::string_view text, MachineFigures& figures) {
  while (!text.empty()) {
    std::string_view line = take(text, '\n');
    const std::string_view name = take(line, ':');
    const auto value = count(takeWord(line));
    if (value && isIn(kMeminfoAmounts, name)) {
      figures.measurements.emplace_back(key({"meminfo", name}), static_cast<double>(*value));
    }
  }
}

void parseLoadavg(std::string_view text, MachineFigures& figures) {
  std::string_view line = take(text, '\n');
  for (const std::string_view name : {"1m", "5m", "15m"}) {
    if (const auto value = measurement(takeWord(line))) {
      figures.measurements.emplace_back(key({"loadavg", name}), *value);
    }
  }
}

void parsePressure(std::string_view resource, std::string_view text, MachineFigures& figures) {
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

void parseTemperature(std::string_view zone, std::string_view text, MachineFigures& figures) {
  if (const auto thousandths = integer(take(text, '\n'))) {
    figures.measurements.emplace_back(key({"thermal", zone, "celsius"}),
                                      static_cast<double>(*thousandths) / 1000);
  }
}

MachineFigures readMachineFigures(const std::string& root) {
  const std::filesystem::path proc = std::filesystem::path(root) / "proc";
  MachineFigures figures;
  parseVmstat(fileText(proc / "vmstat"), figures);
  parseDiskstats(fileText(proc / "diskstats"), figures);
  parseMeminfo(fileText(proc / "meminfo"), figures);
  parseLoadavg(fileText(proc / "loadavg"), figures);
  for (const char* resource : {"cpu", "io", "memory"}) {
    parsePressure(resource, fileText(proc / "pressure" / resource), figures);
  }
  constexpr std::string_view prefix = "thermal_zone";
  std::error_code error;
  std::filesystem::directory_iterator zone(
      std::filesystem::path(root) / "sys" / "class" / "thermal", error);
  for (; !error && zone != std::filesystem::directory_iterator(); zone.increment(error)) {
    const std::string name = zone->path().filename().string();
    if (!name.starts_with(prefix) || !isNumber(name.substr(prefix.size()))) continue;
    parseTemperature(name.substr(prefix.size()), fileText(zone->path() / "temp"), figures);
  }
  return figures;
}

}  // namespace pelloran
