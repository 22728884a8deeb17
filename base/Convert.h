// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The one way from a double to an integer.
#pragma once

#include <cmath>
#include <concepts>
#include <limits>

namespace base {

// Truncates toward zero; what the type can't hold saturates, not-a-number becomes 0.
template <std::integral Integer>
Integer saturatingCast(double value) {
  using Limits = std::numeric_limits<Integer>;
  // 2^digits is exact in a double, the largest value of a 64-bit type is not.
  const double above = std::ldexp(1.0, Limits::digits);
  if (std::isnan(value)) return 0;
  if (value >= above) return Limits::max();
  if (value <= static_cast<double>(Limits::min())) return Limits::min();
  return static_cast<Integer>(value);
}

}  // namespace base
