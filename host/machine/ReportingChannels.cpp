// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/machine/ReportingChannels.h"

#include <algorithm>
#include <cstdint>
#include <limits>
#include <map>
#include <memory>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "host/machine/SourceFiles.h"

namespace host::machine {

namespace {

using Counters = std::map<std::string, std::uint64_t>;

void add(Counters& counters, std::string name, std::optional<std::uint64_t> count) {
  if (!count) return;
  std::uint64_t& sum = counters[std::move(name)];
  sum += std::min(*count, std::numeric_limits<std::uint64_t>::max() - sum);
}

void addMemory(const DeviceRoot& files, Counters& counters) {
  for (const auto& [path, name] : sourceDevices(files, "/sys/devices/system/edac/mc")) {
    const std::string prefix = "edac." + name;
    add(counters, prefix + ".corrected", sourceCount(files, path + "/ce_count"));
    add(counters, prefix + ".uncorrected", sourceCount(files, path + "/ue_count"));
  }
}

void addPCIe(const DeviceRoot& files, Counters& counters) {
  constexpr struct {
    const char *file, *total, *name;
  } kTotals[] = {{"/aer_dev_correctable", "TOTAL_ERR_COR", ".correctable"},
                 {"/aer_dev_fatal", "TOTAL_ERR_FATAL", ".fatal"},
                 {"/aer_dev_nonfatal", "TOTAL_ERR_NONFATAL", ".nonfatal"}};
  for (const auto& [path, device] : sourceDevices(files, "/sys/bus/pci/devices")) {
    for (const auto& [file, total, name] : kTotals) {
      const auto count = countNamed(sourceText(files, path + file), total);
      if (!count) continue;
      const std::string driver = driverOf(files, path);
      if (!driver.empty()) add(counters, "aer." + driver + name, count);
    }
  }
}

void addBlock(const DeviceRoot& files, Counters& counters) {
  for (const auto& [path, name] : sourceDevices(files, "/sys/block")) {
    add(counters, "block." + name + ".io_errors", sourceCount(files, path + "/device/ioerr_cnt"));
  }
}

void addNetwork(const DeviceRoot& files, Counters& counters) {
  for (const auto& [path, device] : sourceDevices(files, "/sys/class/net")) {
    const std::string driver = driverOf(files, path + "/device");
    if (driver.empty()) continue;
    for (const char* name : {"rx_errors", "tx_errors"}) {
      add(counters, "net." + driver + "." + name, sourceCount(files, path + "/statistics/" + name));
    }
  }
}

Counters errorCounters(const DeviceRoot& files) {
  Counters counters;
  addMemory(files, counters);
  addPCIe(files, counters);
  addBlock(files, counters);
  addNetwork(files, counters);
  return counters;
}

class Subscription final : public platform::ChannelSubscription {
 public:
  Subscription(const DeviceRoot& files, std::vector<platform::ReportChannel> channels)
      : files_(files), channels_(std::move(channels)) {}

  std::optional<std::vector<platform::ChannelSample>> createSamples() override {
    const Counters counters = errorCounters(files_);
    std::vector<platform::ChannelSample> samples;
    for (const platform::ReportChannel& channel : channels_) {
      const auto counter = counters.find(channel.name);
      if (counter == counters.end()) continue;
      const auto count = std::min<std::uint64_t>(counter->second, INT64_MAX);
      samples.push_back({channel, static_cast<std::int64_t>(count)});
    }
    return samples;
  }

 private:
  const DeviceRoot& files_;
  const std::vector<platform::ReportChannel> channels_;
};

}  // namespace

std::vector<platform::ReportChannel> ReportingChannels::copyChannels(std::uint64_t categoryMask) {
  std::vector<platform::ReportChannel> channels;
  if ((categoryMask & kErrorCategories) == 0) return channels;
  for (const auto& [name, count] : errorCounters(files_)) {
    channels.push_back({channels.size(), platform::kSimpleChannelFormat, name});
  }
  return channels;
}

std::unique_ptr<platform::ChannelSubscription> ReportingChannels::subscribe(
    const std::vector<platform::ReportChannel>& channels) {
  return std::make_unique<Subscription>(files_, channels);
}

}  // namespace host::machine
