// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The network usage service: device/network-usage.plist, answered on a thread of its own.
#pragma once

#include "host/device/UsageReplies.h"
#include "host/files/DeviceFile.h"
#include "platform/NetworkUsage.h"

namespace host::recorded {

class NetworkUsage final : public platform::NetworkUsage {
 public:
  NetworkUsage(const DeviceRoot& root, platform::SystemLog& log)
      : file_(root, log, "device/network-usage.plist") {}

  // Replies come "ReplyDelay" seconds after their queries (default 0), with the "Records"; without
  // the file at once, with none.
  void queryAllProcesses(Reply reply) override { replies_.queue(std::move(reply)); }

 private:
  UsageReplies::Answer answer();

  DeviceFile file_;
  UsageReplies replies_{[this] { return answer(); }};
};

}  // namespace host::recorded
