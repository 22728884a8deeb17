// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/recorded/NetworkUsage.h"

#include <algorithm>
#include <chrono>
#include <cstdint>

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

UsageReplies::Answer NetworkUsage::answer() {
  const plist::Dictionary* answer = file_.dictionary();
  return {answer != nullptr ? answer->array("Records") : nullptr, replyDelay(answer)};
}

}  // namespace host::recorded
