// The kernel's reporting channels: device/report-channels.plist.
#pragma once

#include "platform/ReportingChannels.h"
#include "platform/host/DeviceFile.h"

namespace platform::host {

class HostReportingChannels : public ReportingChannels {
 public:
  HostReportingChannels(const DeviceRoot& root, PropertyListCodec& codec, SystemLog& log)
      : file_(root, codec, log, "device/report-channels.plist") {}

  // Each dictionary of the array that has a name and a category is a channel, its id the place in
  // the array. A channel without a format has format 0. Without the file there are none.
  std::vector<ReportChannel> copyChannels(std::uint64_t categoryMask) override;

  // The samples leave out channels whose value is not a number.
  std::unique_ptr<ChannelSubscription> subscribe(
      const std::vector<ReportChannel>& channels) override;

 private:
  DeviceFile file_;
};

}  // namespace platform::host
