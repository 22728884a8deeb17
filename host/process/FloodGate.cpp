// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/process/FloodGate.h"

#include <utility>

#include "base/Text.h"
#include "host/files/Files.h"

namespace host {

FloodGate::Next FloodGate::next(std::string_view kind, std::string_view message) {
  if (inARow_ > 0 && kind == kind_) {
    if (++inARow_ > maxSaid_) return {.said = false};
    if (inARow_ == maxSaid_) lastSaid_ = message;
    return {.said = true};
  }
  Next next{.said = true, .before = end()};
  kind_ = kind;
  lastSaid_ = message;
  inARow_ = 1;
  return next;
}

std::optional<std::string> FloodGate::end() {
  const std::size_t row = std::exchange(inARow_, 0);
  if (row <= maxSaid_) return std::nullopt;
  return base::format("%zu more messages like \"%s\"", row - maxSaid_,
                      shownText(lastSaid_).c_str());
}

}  // namespace host
