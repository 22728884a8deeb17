// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The thread of a network usage service, which gives the replies.
#pragma once

#include <chrono>
#include <condition_variable>
#include <deque>
#include <functional>
#include <mutex>
#include <optional>
#include <thread>

#include "platform/NetworkUsage.h"
#include "plist/Value.h"

namespace host {

class UsageReplies {
 public:
  // What queries are replied with, and how long after a query the reply comes. The records are
  // borrowed until the next answer; null: there are none.
  struct Answer {
    const plist::Array* records;
    std::chrono::milliseconds delay = {};
  };

  // `answer` is called on the thread, once for each query; one without an answer is not replied.
  explicit UsageReplies(std::function<std::optional<Answer>()> answer)
      : answer_(std::move(answer)) {}

  // Waits for an answer or a reply that has begun, and drops the others: what they use must outlive
  // this.
  ~UsageReplies();

  // The thread starts with the first query. Replies come in the order of the queries. A host that
  // can't start a thread never replies.
  void queue(platform::NetworkUsage::Reply reply);

 private:
  using Clock = std::chrono::steady_clock;
  struct Query {
    Clock::time_point asked;
    platform::NetworkUsage::Reply reply;
  };

  void serve();

  const std::function<std::optional<Answer>()> answer_;

  std::mutex mutex_;  // over all that follows but the thread
  std::condition_variable changed_;
  std::deque<Query> queries_;
  bool ending_ = false;
  std::thread thread_;
};

}  // namespace host
