// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The error counters that the drivers of the kernel keep, as reporting channels.
//
//   edac.<controller>.corrected, .uncorrected: memory errors
//   aer.<driver>.correctable, .fatal, .nonfatal: errors of PCIe devices, of a driver's all together
//   block.<device>.io_errors: failed requests
//   net.<driver>.rx_errors, .tx_errors: of network devices, of a driver's all together
//
// Each counts since the machine started. A device that doesn't count has no channel.
#pragma once

#include <cstdint>
#include <memory>
#include <vector>

#include "host/files/DeviceRoot.h"
#include "platform/ReportingChannels.h"

namespace host::machine {

// The categories of all channels: the first, and the one that the daemon reports.
inline constexpr std::uint64_t kErrorCategories = 0x101;

class ReportingChannels final : public platform::ReportingChannels {
 public:
  explicit ReportingChannels(const DeviceRoot& files) : files_(files) {}

  // In the order of their names.
  std::vector<platform::ReportChannel> copyChannels(std::uint64_t categoryMask) override;

  // The samples leave out channels that are gone by then.
  std::unique_ptr<platform::ChannelSubscription> subscribe(
      const std::vector<platform::ReportChannel>& channels) override;

 private:
  const DeviceRoot& files_;
};

}  // namespace host::machine
