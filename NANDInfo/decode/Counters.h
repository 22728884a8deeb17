// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Reading counters out of a dictionary.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "base/Text.h"
#include "plist/Value.h"

namespace NANDInfo {

// The number's low 32 bits as a signed number (a boolean is 0 or 1, a real is cut to a whole number
// before); none when the dictionary doesn't have it.
inline std::optional<std::int32_t> signed32(const plist::Dictionary& counters,
                                            std::string_view name) {
  const plist::Number* number = counters.number(name);
  if (number == nullptr) return std::nullopt;
  return static_cast<std::int32_t>(static_cast<std::uint32_t>(number->int64Value()));
}

// The counter as a signed number; none when the dictionary doesn't have it.
inline std::optional<std::int64_t> signed64(const plist::Dictionary& counters,
                                            std::string_view name) {
  const plist::Number* number = counters.number(name);
  return number != nullptr ? std::optional(number->int64Value()) : std::nullopt;
}

// The name of an array's element.
inline std::string indexed(std::string_view name, std::uint64_t index) {
  std::string text(name);
  base::appendInteger(text, index);
  return text;
}

}  // namespace NANDInfo
