// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The services that Linux has nothing for.
#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <vector>

#include "platform/InstalledApplications.h"
#include "platform/NetworkUsage.h"
#include "platform/PurgeableSpace.h"
#include "platform/ReportingChannels.h"
#include "plist/Value.h"

namespace host::machine {

class NoPurgeableSpace final : public platform::PurgeableSpace {
 public:
  bool isPresent() override { return false; }
  std::optional<plist::Dictionary> SpacereapCopyItemizedPurgeableSpaceWithInfo(
      const plist::Dictionary&) override {
    return std::nullopt;
  }
};

class NoReportingChannels final : public platform::ReportingChannels {
 public:
  std::vector<platform::ReportChannel> copyChannels(std::uint64_t) override { return {}; }
  std::unique_ptr<platform::ChannelSubscription> subscribe(
      const std::vector<platform::ReportChannel>&) override {
    return nullptr;
  }
};

class NoApplications final : public platform::InstalledApplications {
 public:
  void enumerateBundles(const std::function<void(BundleType)>&) override {}
};

class NoNetworkUsage final : public platform::NetworkUsage {
 public:
  void queryAllProcesses(Reply reply) override { reply(nullptr); }
};

}  // namespace host::machine
