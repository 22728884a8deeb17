// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/device/UsageReplies.h"

#include <optional>
#include <system_error>
#include <utility>

namespace host {

UsageReplies::~UsageReplies() {
  {
    const std::scoped_lock lock(mutex_);
    ending_ = true;
    changed_.notify_one();
  }
  if (thread_.joinable()) thread_.join();
}

void UsageReplies::queue(platform::NetworkUsage::Reply reply) {
  {
    const std::scoped_lock lock(mutex_);
    queries_.push_back({Clock::now(), std::move(reply)});
    changed_.notify_one();
  }
  if (thread_.joinable()) return;
  try {
    thread_ = std::thread([this] { serve(); });
  } catch (const std::system_error&) {
    // The next query tries again.
  }
}

void UsageReplies::serve() {
  std::unique_lock lock(mutex_);
  for (;;) {
    changed_.wait(lock, [this] { return ending_ || !queries_.empty(); });
    if (ending_) return;
    Query query = std::move(queries_.front());
    queries_.pop_front();
    lock.unlock();
    const std::optional<Answer> answer = answer_();
    lock.lock();
    if (!answer) continue;
    if (changed_.wait_until(lock, query.asked + answer->delay, [this] { return ending_; })) return;
    lock.unlock();
    query.reply(answer->records);
    query.reply = nullptr;
    lock.lock();
  }
}

}  // namespace host
