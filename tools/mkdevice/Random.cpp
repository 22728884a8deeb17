// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/mkdevice/Random.h"

namespace mkdevice {

Random::Random(std::uint64_t seed, std::string_view name) : state_(seed) {
  for (const char c : name) {
    state_ = (state_ ^ static_cast<unsigned char>(c)) * 0x100000001B3U;
    next();
  }
}

std::uint64_t Random::next() {
  std::uint64_t z = state_ += 0x9E3779B97F4A7C15U;
  z = (z ^ (z >> 30)) * 0xBF58476D1CE4E5B9U;
  z = (z ^ (z >> 27)) * 0x94D049BB133111EBU;
  return z ^ (z >> 31);
}

std::int64_t Random::between(std::int64_t least, std::int64_t most) {
  const auto count = static_cast<std::uint64_t>(most) - static_cast<std::uint64_t>(least) + 1;
  const std::uint64_t above = count == 0 ? next() : next() % count;
  return static_cast<std::int64_t>(static_cast<std::uint64_t>(least) + above);
}

std::string Random::hexadecimal(int digits) {
  std::string text;
  while (digits-- > 0) text += "0123456789abcdef"[next() % 16];
  return text;
}

double Random::bell() {
  // The variance of four fractions' sum is a third.
  constexpr double kSquareRootOf3 = 1.7320508075688772;
  const double sum = fraction() + fraction() + fraction() + fraction();
  return (sum - 2) * kSquareRootOf3;
}

}  // namespace mkdevice
