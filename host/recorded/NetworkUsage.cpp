// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/recorded/NetworkUsage.h"

#include <algorithm>
#include <cstdint>
#include <system_error>

#include "base/Convert.h"

namespace host::recorded {

namespace {

constexpr std::int64_t kMaxDelay = std::int64_t{1} << 40;  // milliseconds

std::chrono::milliseconds replyDelay(const plist::Dictionary* answer) {
  const plist::Number* seconds = answer != nullptr ? answer->number("ReplyDelay") : nullptr;
  if (seconds == nullptr) return {};
  const auto milliseconds = base::saturatingCast<std::int64_t>(seconds->doubleValue() * 1000);
  return std::chrono::milliseconds(std::clamp<std::int64_t>(milliseconds, 0, kMaxDelay));
}

}  // namespace

NetworkUsage::~NetworkUsage() {
  {
    const std::scoped_lock lock(mutex_);
    ending_ = true;
    changed_.notify_one();
  }
  if (thread_.joinable()) thread_.join();
}

void NetworkUsage::queryAllProcesses(Reply reply) {
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

void NetworkUsage::serve() {
  const plist::Dictionary* answer = file_.dictionary();
  const plist::Array* records = answer != nullptr ? answer->array("Records") : nullptr;
  const auto delay = replyDelay(answer);
  std::unique_lock lock(mutex_);
  while (!ending_) {
    if (queries_.empty()) {
      changed_.wait(lock);
    } else if (const auto due = queries_.front().asked + delay; Clock::now() < due) {
      changed_.wait_until(lock, due);
    } else {
      Query query = std::move(queries_.front());
      queries_.pop_front();
      lock.unlock();
      query.reply(records);
      query.reply = nullptr;
      lock.lock();
    }
  }
}

}  // namespace host::recorded
