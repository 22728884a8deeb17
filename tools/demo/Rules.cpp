// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/demo/Rules.h"

#include "base/Text.h"

namespace demo {

using report::CounterOptions;

namespace {

// The whitelist doesn't say which entry its options stand in, but each entry has options of its
// own: where a longer key, which nothing names, gets the same ones, a prefix has matched, and the
// shortest cut of the key that still gets them is that prefix.
template <typename Lookup>
std::optional<Rule> ruleOf(std::string_view key, const Lookup& lookup) {
  const CounterOptions* options = lookup(std::string(key));
  if (options == nullptr) return std::nullopt;
  const auto matches = [&](std::string_view cut) {
    return lookup(std::string(cut) + '\x7f') == options;
  };
  if (!matches(key)) return Rule{options, std::nullopt};
  while (!key.empty() && matches(key.substr(0, key.size() - 1))) key.remove_suffix(1);
  return Rule{options, std::string(key)};
}

}  // namespace

std::optional<Rule> Rules::ofScalar(std::string_view key) const {
  if (whitelist_ == nullptr) return std::nullopt;
  return ruleOf(key,
                [this](const std::string& k) { return whitelist_->configOptionsForScalarKey(k); });
}

std::optional<Rule> Rules::ofDistribution(std::string_view key) const {
  if (whitelist_ == nullptr) return std::nullopt;
  return ruleOf(
      key, [this](const std::string& k) { return whitelist_->configOptionsForDistributionKey(k); });
}

std::string roundingText(const CounterOptions& options) {
  std::string text;
  if (options.bucketInterval) {
    text = "nearest " + std::to_string(*options.bucketInterval);
  }
  if (options.significantFigures) {
    if (!text.empty()) text += ", ";
    text += std::to_string(*options.significantFigures);
    text += *options.significantFigures == 1 ? " figure" : " figures";
  }
  return text.empty() ? "as it is" : text;
}

}  // namespace demo
