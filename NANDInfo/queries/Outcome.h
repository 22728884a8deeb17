// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What came of a question to the storage library.
#pragma once

#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "base/Result.h"
#include "plist/Value.h"

namespace NANDInfo {

// A value, or none; and why it is no good, where who answers knows better than the library.
struct [[nodiscard]] Outcome {
  Outcome() = default;
  Outcome(plist::Value answer, std::optional<base::Error> failure = {})
      : value(std::move(answer)), error(std::move(failure)) {}
  Outcome(base::Error failure) : error(std::move(failure)) {}

  std::optional<plist::Value> value;
  std::optional<base::Error> error;
};

// Why the work failed, or none if it didn't: no result, one that is an error, one that holds
// nothing but the library's message, or one that says itself that it isn't right.
std::optional<std::string> failureOf(const Outcome& outcome);

// The same in one line with the reasons, if there are any.
std::string withReasons(std::string why, const std::vector<std::string>& reasons);

}  // namespace NANDInfo
