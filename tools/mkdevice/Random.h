// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Numbers that look random and are the same everywhere: splitmix64. The distributions of <random>
// differ between libraries.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

namespace mkdevice {

class Random {
 public:
  // A sequence for each seed and name, independent of all others.
  Random(std::uint64_t seed, std::string_view name);
  Random(std::uint64_t seed, std::string_view name, std::int64_t number)
      : Random(seed ^ static_cast<std::uint64_t>(number) * 0x9E3779B97F4A7C15U, name) {}

  std::uint64_t next();

  // From 0 to 1, 1 left out.
  double fraction() { return static_cast<double>(next() >> 11) * 0x1p-53; }

  // From `least` to `most`, both included.
  std::int64_t between(std::int64_t least, std::int64_t most);

  std::string hexadecimal(int digits);

  // Bell-shaped around 0 with a standard deviation of 1, never beyond 3.5.
  double bell();

 private:
  std::uint64_t state_;
};

}  // namespace mkdevice
