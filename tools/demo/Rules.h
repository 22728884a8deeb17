// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// By which rule of the whitelist a counter is reported.
#pragma once

#include <optional>
#include <string>
#include <string_view>

#include "report/PLConfig.h"

namespace demo {

struct Rule {
  const report::CounterOptions* options;  // borrowed from the whitelist
  std::optional<std::string> prefix;      // none: the key has an entry of its own
};

class Rules {
 public:
  // `whitelist` may be null; it is borrowed.
  explicit Rules(const report::PLConfig* whitelist) : whitelist_(whitelist) {}

  // None for a key that isn't reported.
  std::optional<Rule> ofScalar(std::string_view key) const;
  std::optional<Rule> ofDistribution(std::string_view key) const;

 private:
  const report::PLConfig* whitelist_;
};

// The options in words: "nearest 10, 2 figures".
std::string roundingText(const report::CounterOptions& options);

}  // namespace demo
