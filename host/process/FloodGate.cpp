// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/process/FloodGate.h"

#include <utility>

#include "base/Text.h"
#include "host/files/Files.h"

namespace host {

FloodGate::Next FloodGate::next(std::string_view kind, std::string_view message,
                                std::size_t maxSaid) {
  if (inARow_ > 0 && kind == kind_) {
    ++inARow_;
    if (inARow_ == maxSaid_) lastSaid_ = message;
    if (inARow_ == maxSaid_ + 1) notSaid_ = message;
    return {.said = inARow_ <= maxSaid_};
  }
  Next next{.said = true, .before = end()};
  kind_ = kind;
  lastSaid_ = message;
  inARow_ = 1;
  maxSaid_ = maxSaid;
  return next;
}

std::optional<std::string> FloodGate::end() {
  const std::size_t row = std::exchange(inARow_, 0);
  if (row <= maxSaid_) return std::nullopt;
  if (row == maxSaid_ + 1) return notSaid_;
  return base::format("%zu more messages like \"%s\"", row - maxSaid_,
                      shownText(lastSaid_.substr(0, lastSaid_.find('\n'))).c_str());
}

}  // namespace host
