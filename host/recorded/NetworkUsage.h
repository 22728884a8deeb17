// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The network usage service: device/network-usage.plist, answered on a thread of its own.
#pragma once

#include <chrono>
#include <condition_variable>
#include <deque>
#include <mutex>
#include <thread>

#include "host/files/DeviceFile.h"
#include "platform/NetworkUsage.h"

namespace host::recorded {

class NetworkUsage final : public platform::NetworkUsage {
 public:
  NetworkUsage(const DeviceRoot& root, platform::SystemLog& log)
      : file_(root, log, "device/network-usage.plist") {}

  // Waits for a reply that has begun, and drops the others: what replies use must outlive this.
  ~NetworkUsage() override;

  // The thread starts with the first query. Replies come "ReplyDelay" seconds after their queries
  // (default 0), in the order of these, with the "Records"; without the file at once, with none. A
  // host that can't start a thread never replies.
  void queryAllProcesses(Reply reply) override;

 private:
  using Clock = std::chrono::steady_clock;
  struct Query {
    Clock::time_point asked;
    Reply reply;
  };

  void serve();

  DeviceFile file_;

  std::mutex mutex_;  // over all that follows but the thread
  std::condition_variable changed_;
  std::deque<Query> queries_;
  bool ending_ = false;
  std::thread thread_;
};

}  // namespace host::recorded
