// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/machine/NetworkUsage.h"

#include <algorithm>
#include <array>
#include <chrono>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <limits>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "host/files/Files.h"
#include "host/machine/SourceFiles.h"

namespace host::machine {

namespace {

constexpr std::chrono::seconds kPatience(5);
constexpr std::size_t kMaxRoutes = std::size_t{1} << 20;  // bytes

// What is remembered: beside the baseline that the counts are compared with.
constexpr char kRemembered[] = "netUsageByRoute";
constexpr char kDomain[] = "com.norba.quenset.morvend";

// The counts of a record: not mobile, then mobile, in each what was received and sent.
constexpr const char* kCounts[] = {"wifiInBytes", "wifiOutBytes", "wwanInBytes", "wwanOutBytes"};
using Counts = std::array<std::int64_t, 4>;

std::int64_t bytes(std::uint64_t count) {
  return static_cast<std::int64_t>(std::min<std::uint64_t>(count, INT64_MAX));
}

// What is remembered of a unit that became active at that second; zeros when it is nothing.
Counts countsSince(const plist::Dictionary& remembered, const std::string& unit, double since) {
  Counts counts{};
  const plist::Array* entry = remembered.array(unit);
  if (entry == nullptr || entry->size() != 1 + counts.size()) return counts;
  const auto* date = entry->front().as<plist::Date>();
  if (date == nullptr || std::floor(date->secondsSince1970) != std::floor(since)) return counts;
  for (std::size_t i = 0; i < counts.size(); ++i) {
    const auto* number = (*entry)[1 + i].as<plist::Number>();
    // Half of what there is at most: a sum of two has room.
    counts[i] = number ? std::clamp<std::int64_t>(number->int64Value(), 0, INT64_MAX / 2) : 0;
  }
  return counts;
}

// Adds what is new in one direction (0 received, 1 sent) to its count of today's kind.
void addNew(Counts& counts, std::size_t direction, bool isMobile, std::int64_t total) {
  std::int64_t& other = counts[direction + (isMobile ? 0 : 2)];
  std::int64_t& today = counts[direction + (isMobile ? 2 : 0)];
  if (total < other + today) other = 0;  // not the counter that is remembered
  today = total - other;
}

// The interface of the default route in the kernel's table, by the place of its fields.
struct RouteTable {
  const char* path;
  std::size_t fields, interface, destination, prefix, flags, metric;
  std::string_view noPrefix;
  int metricBase;
};

std::string defaultInterface(const DeviceRoot& files, const RouteTable& table) {
  constexpr std::uint64_t kUp = 1;
  std::string interface;
  std::uint64_t lowest = std::numeric_limits<std::uint64_t>::max();
  const auto text = sourceText(files, table.path, kMaxRoutes);
  if (!text) return interface;
  for (std::string_view lines = *text; !lines.empty();) {
    std::string_view line = takeUntil(lines, '\n');
    std::vector<std::string_view> fields;
    while (fields.size() < table.fields) fields.push_back(takeWord(line));
    const std::string hexadecimal = "0x";
    const auto flags = countIn(hexadecimal + std::string(fields[table.flags]));
    const auto metric =
        countIn((table.metricBase == 16 ? hexadecimal : "") + std::string(fields[table.metric]));
    const bool isDefault = !fields[table.destination].empty() &&
                           fields[table.destination].find_first_not_of('0') == line.npos &&
                           fields[table.prefix] == table.noPrefix;
    if (!isDefault || !flags || (*flags & kUp) == 0 || !metric || *metric >= lowest) continue;
    if (fields[table.interface] == "lo") continue;
    interface = fields[table.interface];
    lowest = *metric;
  }
  return interface;
}

}  // namespace

bool defaultRouteIsMobile(const DeviceRoot& files) {
  // The routes of the machine, whatever network this process has of its own.
  constexpr RouteTable kTables[] = {{"/proc/1/net/route", 8, 0, 1, 7, 3, 6, "00000000", 10},
                                    {"/proc/1/net/ipv6_route", 10, 9, 0, 1, 8, 5, "00", 16}};
  for (const RouteTable& table : kTables) {
    const std::string interface = defaultInterface(files, table);
    if (!isPlainFileName(interface, kMaxFileName)) continue;
    const auto device = sourceText(files, "/sys/class/net/" + interface + "/uevent");
    return device && assignedValue(*device, "DEVTYPE") == "wwan";
  }
  return false;
}

UsageByRoute usageByRoute(const plist::Dictionary& remembered,
                          const std::vector<UnitTraffic>& units, bool isMobile) {
  UsageByRoute usage;
  for (const UnitTraffic& unit : units) {
    Counts counts = countsSince(remembered, unit.name, unit.since);
    addNew(counts, 0, isMobile, bytes(unit.received));
    addNew(counts, 1, isMobile, bytes(unit.sent));
    plist::Dictionary record{{"procName", unit.name},
                             {platform::kUsageSinceKey, plist::Date{unit.since}}};
    plist::Array entry{plist::Date{unit.since}};
    for (std::size_t i = 0; i < counts.size(); ++i) {
      record.set(kCounts[i], plist::Value(counts[i]));
      entry.emplace_back(counts[i]);
    }
    usage.records.emplace_back(std::move(record));
    usage.remembered.set(unit.name, plist::Value(std::move(entry)));
  }
  return usage;
}

std::optional<UsageReplies::Answer> NetworkUsage::answer() {
  const auto units = unitTraffic(kPatience);
  const auto before = preferences_.readValue(kRemembered, kDomain);
  if (!units || !before) {
    log_.log(platform::LogLevel::error, "Can't tell the network usage of systemd's units: %s",
             (units ? before.error() : units.error()).text.c_str());
    return std::nullopt;
  }
  const auto* stored = *before ? (*before)->as<plist::Dictionary>() : nullptr;
  UsageByRoute usage = usageByRoute(stored != nullptr ? *stored : plist::Dictionary(), *units,
                                    defaultRouteIsMobile(files_));
  records_ = std::move(usage.records);
  // It is on disk with the baseline that the reply leads to.
  const plist::Value remembered(std::move(usage.remembered));
  if (stored != nullptr || !units->empty()) {
    preferences_.QNSPreferencesSetValue(kRemembered, units->empty() ? nullptr : &remembered,
                                        kDomain);
  }
  return UsageReplies::Answer{.records = &records_};
}

}  // namespace host::machine
