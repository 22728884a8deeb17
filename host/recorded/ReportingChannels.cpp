// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/recorded/ReportingChannels.h"

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace host::recorded {

namespace {

class FileSubscription : public platform::ChannelSubscription {
 public:
  FileSubscription(const plist::Array& entries,
                   const std::vector<platform::ReportChannel>& channels)
      : entries_(entries), channels_(channels) {}

  std::optional<std::vector<platform::ChannelSample>> createSamples() override {
    std::vector<platform::ChannelSample> samples;
    for (const platform::ReportChannel& channel : channels_) {
      if (channel.id >= entries_.size()) continue;
      const auto* entry = entries_[channel.id].as<plist::Dictionary>();
      const plist::Number* value = entry != nullptr ? entry->number("Value") : nullptr;
      if (value != nullptr) samples.push_back({channel, value->int64Value()});
    }
    return samples;
  }

 private:
  const plist::Array& entries_;
  std::vector<platform::ReportChannel> channels_;
};

}  // namespace

std::vector<platform::ReportChannel> ReportingChannels::copyChannels(std::uint64_t categoryMask) {
  std::vector<platform::ReportChannel> channels;
  const plist::Array* entries = file_.array();
  if (entries == nullptr) return channels;
  for (std::size_t id = 0; id < entries->size(); ++id) {
    const auto* entry = (*entries)[id].as<plist::Dictionary>();
    if (entry == nullptr) continue;
    const std::string* name = entry->text("Name");
    const plist::Number* category = entry->number("Category");
    const plist::Number* format = entry->number("Format");
    if (name == nullptr || category == nullptr) continue;
    if ((category->uint64Value() & categoryMask) == 0) continue;
    channels.push_back({id, format != nullptr ? format->int64Value() : 0, *name});
  }
  return channels;
}

std::unique_ptr<platform::ChannelSubscription> ReportingChannels::subscribe(
    const std::vector<platform::ReportChannel>& channels) {
  const plist::Array* entries = file_.array();
  if (entries == nullptr) return nullptr;
  return std::make_unique<FileSubscription>(*entries, channels);
}

}  // namespace host::recorded
