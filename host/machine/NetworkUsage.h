// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The network usage of this machine: the traffic of systemd's units, where it is accounted.
#pragma once

#include <optional>
#include <vector>

#include "host/device/UsageReplies.h"
#include "host/files/DeviceRoot.h"
#include "host/machine/UnitTraffic.h"
#include "platform/NetworkUsage.h"
#include "platform/PreferenceStore.h"
#include "platform/SystemLog.h"
#include "plist/Value.h"

namespace host::machine {

// Whether the default route leads over a mobile network: the one of the lowest metric, of IPv4 if
// there is any.
bool defaultRouteIsMobile(const DeviceRoot& files);

// Usage records of units, and what is to be remembered for the next ones: under each unit's name
// the date since when and the four counts, in the order of a record's. What a unit has sent and
// received since it was last remembered is counted under the kind of the default route that there
// is now, so that each count only grows for as long as the unit isn't started anew.
struct UsageByRoute {
  plist::Array records;
  plist::Dictionary remembered;
};
UsageByRoute usageByRoute(const plist::Dictionary& remembered,
                          const std::vector<UnitTraffic>& units, bool isMobile);

class NetworkUsage final : public platform::NetworkUsage {
 public:
  // All are borrowed.
  NetworkUsage(const DeviceRoot& files, platform::PreferenceStore& preferences,
               platform::SystemLog& log)
      : files_(files), preferences_(preferences), log_(log) {}

  // The records name units as processes. Where systemd can't be asked for them, which is said with
  // an error line, no reply comes: nobody is to take it for a machine without traffic.
  void queryAllProcesses(Reply reply) override { replies_.queue(std::move(reply)); }

 private:
  std::optional<UsageReplies::Answer> answer();

  const DeviceRoot& files_;
  platform::PreferenceStore& preferences_;
  platform::SystemLog& log_;
  plist::Array records_;
  UsageReplies replies_{[this] { return answer(); }};  // last: its thread uses the others
};

}  // namespace host::machine
