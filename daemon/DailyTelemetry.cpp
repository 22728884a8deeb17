// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "daemon/DailyTelemetry.h"

#include <array>
#include <string>
#include <vector>

#include "NANDInfo/NANDInfo.h"
#include "daemon/DataUsage.h"
#include "daemon/EccEvents.h"
#include "platform/CountersService.h"
#include "platform/DeviceProperties.h"
#include "platform/ReportingChannels.h"
#include "platform/SystemLog.h"

namespace morvend {

using platform::LogLevel;
using platform::ReportChannel;
using platform::ScalarValue;
using plist::Number;

namespace {

constexpr std::uint64_t kReportedCategory = 0x100;

std::int64_t mebibytes(std::optional<std::int64_t> bytes) { return bytes ? *bytes >> 20 : -1; }

void CollectDiskUsage(platform::DeviceProperties& properties, platform::CountersService& counters) {
  const auto usage = properties.diskUsage().value_or(platform::DeviceProperties::DiskUsage());
  counters.PLClientSetValuesForScalarKeys(std::array{
      ScalarValue{"com.norba.tarvenn.DiskUsageUserTotalBlocks", mebibytes(usage.totalDiskCapacity)},
      ScalarValue{"com.norba.tarvenn.DiskUsageUserBlocksFree",
                  mebibytes(usage.totalDataAvailable)}});
}

void CollectStorageHealth(const NANDInfo::Services& storage, platform::CountersService& counters,
                          platform::SystemLog& log) {
  auto info = NANDInfo::CopyNANDInfoWithOptions(storage);
  if (!info) {
    log.log(LogLevel::standard, "failed to get NAND info dict");
    return;
  }
  for (const auto& [key, value] : NANDInfo::CopyVMFreezerNANDInfo(storage)) info->set(key, value);
  if (const auto* error = info->find(NANDInfo::kNANDInfoErrorKey)) {
    log.log(LogLevel::standard, "error reading nand info, error %s with message %s",
            description(*error).c_str(),
            description(info->find(NANDInfo::kNANDInfoErrorMessageKey)).c_str());
    return;
  }
  std::vector<ScalarValue> values;
  for (const auto& [key, value] : *info) {
    if (const auto* number = value.as<Number>()) values.push_back({key, number->int64Value()});
  }
  counters.PLClientSetValuesForScalarKeys(values);
}

void CollectReportChannels(platform::ReportingChannels& facility,
                           platform::CountersService& counters) {
  auto channels = facility.copyChannels(kReportedCategory);
  if (channels.empty()) return;
  std::erase_if(channels, [](const ReportChannel& channel) {
    return channel.format != platform::kSimpleChannelFormat;
  });
  const auto subscription = facility.subscribe(channels);
  const auto samples = subscription ? subscription->createSamples() : std::nullopt;
  if (!samples) return;
  std::vector<std::string> keys;
  keys.reserve(samples->size());  // they are borrowed, and must not move
  std::vector<ScalarValue> values;
  for (const auto& [channel, value] : *samples) {
    if (channel.format != platform::kSimpleChannelFormat) continue;
    keys.push_back("com.norba.velquist." + channel.name);
    values.push_back({keys.back(), value});
  }
  counters.PLClientSetValuesForScalarKeys(values);
}

struct Collector {
  const char* name;
  void (*collect)(const Services&);
};

constexpr Collector kCollectors[] = {
    {"disk usage",
     [](const Services& services) {
       CollectDiskUsage(services.deviceProperties, services.counters);
     }},
    {"storage log",
     [](const Services& services) { NANDInfo::DumpStorageStructuredLog(services.storage, false); }},
    {"storage health",
     [](const Services& services) {
       CollectStorageHealth(services.storage, services.counters, services.log);
     }},
    {"memory errors",
     [](const Services& services) {
       CollectEccEvents(services.kernel, services.faultwatch, services.log);
     }},
    {"data usage",
     [](const Services& services) {
       CollectDataUsage(services.networkUsage, services.counters, services.preferences,
                        services.log);
     }},
    {"report channels",
     [](const Services& services) {
       CollectReportChannels(services.reportingChannels, services.counters);
     }},
};

}  // namespace

void CollectDailyTelemetry(const Services& services) {
  for (const Collector& collector : kCollectors) {
    services.log.log(LogLevel::debug, "telemetry: %s", collector.name);
    collector.collect(services);
  }
}

}  // namespace morvend
