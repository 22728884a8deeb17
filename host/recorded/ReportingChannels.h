// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The kernel's reporting channels: device/report-channels.plist.
#pragma once

#include "host/files/DeviceFile.h"
#include "platform/ReportingChannels.h"

namespace host::recorded {

class ReportingChannels : public platform::ReportingChannels {
 public:
  ReportingChannels(const DeviceRoot& root, platform::SystemLog& log)
      : file_(root, log, "device/report-channels.plist") {}

  // Each dictionary of the array that has a name and a category is a channel, its id the place in
  // the array. A channel without a format has format 0. Without the file there are none.
  std::vector<platform::ReportChannel> copyChannels(std::uint64_t categoryMask) override;

  // The samples leave out channels whose value is not a number.
  std::unique_ptr<platform::ChannelSubscription> subscribe(
      const std::vector<platform::ReportChannel>& channels) override;

 private:
  DeviceFile file_;
};

}  // namespace host::recorded
