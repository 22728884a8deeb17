// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "base/KeyIndex.h"

#include <cstring>
#include <random>

namespace base {

namespace {

std::uint64_t load(const char* bytes, std::size_t count) {
  std::uint64_t word = 0;
  std::memcpy(&word, bytes, count);
  return word;
}

std::uint64_t mix(std::uint64_t a, std::uint64_t b) {
  __extension__ using Wide = unsigned __int128;
  const Wide product = static_cast<Wide>(a) * b;
  return static_cast<std::uint64_t>(product) ^ static_cast<std::uint64_t>(product >> 64);
}

}  // namespace

std::uint32_t keyHash(std::string_view key) {
  static const std::uint64_t seed = [] {
    std::random_device device;
    return (static_cast<std::uint64_t>(device()) << 32) | device();
  }();
  constexpr std::uint64_t kFactor = 0x9e3779b97f4a7c15u;
  std::uint64_t hash = seed ^ key.size();
  const char* bytes = key.data();
  std::size_t left = key.size();
  for (; left >= 8; left -= 8, bytes += 8) hash = mix(hash ^ load(bytes, 8), kFactor);
  if (left > 0) hash = mix(hash ^ load(bytes, left), kFactor);
  return static_cast<std::uint32_t>(mix(hash, seed | 1));
}

void KeyIndex::grow() {
  std::vector<Slot> old(2 * slots_.size(), Slot{0, 0});
  old.swap(slots_);
  taken_ = 0;
  for (const Slot& slot : old) {
    if (slot.placeAfter != 0) insert(slot.hash, slot.placeAfter - 1);
  }
}

}  // namespace base
