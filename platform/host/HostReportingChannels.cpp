#include "platform/host/HostReportingChannels.h"

namespace platform::host {

namespace {

class FileSubscription : public ChannelSubscription {
 public:
  FileSubscription(const Array& entries, const std::vector<ReportChannel>& channels)
      : entries_(entries), channels_(channels) {}

  std::optional<std::vector<ChannelSample>> createSamples() override {
    std::vector<ChannelSample> samples;
    for (const ReportChannel& channel : channels_) {
      if (channel.id >= entries_.size()) continue;
      const auto* entry = entries_[channel.id].as<Dictionary>();
      const Number* value = entry != nullptr ? entry->number("Value") : nullptr;
      if (value != nullptr) samples.push_back({channel, value->int64Value()});
    }
    return samples;
  }

 private:
  const Array& entries_;
  std::vector<ReportChannel> channels_;
};

}  // namespace

std::vector<ReportChannel> HostReportingChannels::copyChannels(std::uint64_t categoryMask) {
  std::vector<ReportChannel> channels;
  const Array* entries = file_.array();
  if (entries == nullptr) return channels;
  for (std::size_t id = 0; id < entries->size(); ++id) {
    const auto* entry = (*entries)[id].as<Dictionary>();
    if (entry == nullptr) continue;
    const std::string* name = entry->text("Name");
    const Number* category = entry->number("Category");
    const Number* format = entry->number("Format");
    if (name == nullptr || category == nullptr) continue;
    if ((category->uint64Value() & categoryMask) == 0) continue;
    channels.push_back({id, format != nullptr ? format->int64Value() : 0, *name});
  }
  return channels;
}

std::unique_ptr<ChannelSubscription> HostReportingChannels::subscribe(
    const std::vector<ReportChannel>& channels) {
  const Array* entries = file_.array();
  if (entries == nullptr) return nullptr;
  return std::make_unique<FileSubscription>(*entries, channels);
}

}  // namespace platform::host
