// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// By which rule a value of the telemetry or of an analytics event leaves the device.
#pragma once

#include <compare>
#include <optional>
#include <string>
#include <string_view>

namespace demo {

struct CounterRule {
  std::string step, rule;  // which part of the telemetry sets it, and why this key
  auto operator<=>(const CounterRule&) const = default;
};

// None for a key that the telemetry doesn't set.
std::optional<CounterRule> counterRule(std::string_view key);

// Of an entry of the NAND log, by its key.
std::string nandLogRule(std::string_view key);

std::string eventRule(std::string_view event);

}  // namespace demo
