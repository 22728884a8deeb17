// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The kernel's reporting facility: figures that it keeps in channels.
#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace platform {

struct ReportChannel {
  std::uint64_t id;
  std::int64_t format;
  std::string name;
};

// The format of a channel that holds one integer.
inline constexpr std::int64_t kSimpleChannelFormat = 1;

struct ChannelSample {
  ReportChannel channel;
  std::int64_t integerValue;  // at index 0; of a simple channel
};

class ChannelSubscription {
 public:
  virtual ~ChannelSubscription() = default;

  // One sample of every channel that was subscribed to, or none when they can't be taken.
  virtual std::optional<std::vector<ChannelSample>> createSamples() = 0;
};

class ReportingChannels {
 public:
  virtual ~ReportingChannels() = default;

  // The channels whose category has a bit in common with the mask; empty when there are none.
  virtual std::vector<ReportChannel> copyChannels(std::uint64_t categoryMask) = 0;

  // Null when they can't be subscribed to. The subscription lives no longer than the facility.
  virtual std::unique_ptr<ChannelSubscription> subscribe(
      const std::vector<ReportChannel>& channels) = 0;
};

}  // namespace platform
