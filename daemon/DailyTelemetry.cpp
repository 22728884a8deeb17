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

void CollectDiskUsage(const Services& services) {
  const auto usage =
      services.deviceProperties.diskUsage().value_or(platform::DeviceProperties::DiskUsage());
  services.counters.PLClientSetValuesForScalarKeys(std::array{
      ScalarValue{"com.norba.tarvenn.DiskUsageUserTotalBlocks", mebibytes(usage.totalDiskCapacity)},
      ScalarValue{"com.norba.tarvenn.DiskUsageUserBlocksFree",
                  mebibytes(usage.totalDataAvailable)}});
}

void CollectStorageHealth(const Services& services) {
  auto info = NANDInfo::CopyNANDInfoWithOptions(services.storage);
  if (!info) {
    services.log.log(LogLevel::standard, "failed to get NAND info dict");
    return;
  }
  for (const auto& [key, value] : NANDInfo::CopyVMFreezerNANDInfo(services.storage)) info->set(key, value);
  if (const auto* error = info->find(NANDInfo::kNANDInfoErrorKey)) {
    services.log.log(LogLevel::standard, "error reading nand info, error %s with message %s",
                     description(*error).c_str(),
                     description(info->find(NANDInfo::kNANDInfoErrorMessageKey)).c_str());
    return;
  }
  std::vector<ScalarValue> values;
  for (const auto& [key, value] : *info) {
    if (const auto* number = value.as<Number>()) values.push_back({key, number->int64Value()});
  }
  services.counters.PLClientSetValuesForScalarKeys(values);
}

void CollectReportChannels(const Services& services) {
  auto channels = services.reportingChannels.copyChannels(kReportedCategory);
  if (channels.empty()) return;
  std::erase_if(channels, [](const ReportChannel& channel) {
    return channel.format != platform::kSimpleChannelFormat;
  });
  const auto subscription = services.reportingChannels.subscribe(channels);
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
  services.counters.PLClientSetValuesForScalarKeys(values);
}

struct Collector {
  const char* name;
  void (*collect)(const Services&);
};

constexpr Collector kCollectors[] = {
    {"disk usage", CollectDiskUsage},
    {"storage log",
     [](const Services& services) { NANDInfo::DumpStorageStructuredLog(services.storage, false); }},
    {"storage health", CollectStorageHealth},
    {"memory errors", CollectEccEvents},
    {"data usage", [](const Services& services) { CollectDataUsage(services); }},
    {"report channels", CollectReportChannels},
};

}  // namespace

void CollectDailyTelemetry(const Services& services) {
  for (const Collector& collector : kCollectors) {
    services.log.log(LogLevel::debug, "telemetry: %s", collector.name);
    collector.collect(services);
  }
}

}  // namespace morvend
