// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "base/KeyIndex.h"

#include <cstring>
#include <random>

namespace base {

namespace {

template <typename Word>
Word load(const char* bytes) {
  Word word;
  std::memcpy(&word, bytes, sizeof word);
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
  const char* const end = bytes + key.size();
  for (; end - bytes > 8; bytes += 8) hash = mix(hash ^ load<std::uint64_t>(bytes), kFactor);
  // The rest, in words that may overlap: a copy of so many bytes as there are costs more.
  std::uint64_t rest = 0;
  if (key.size() >= 8) {
    rest = load<std::uint64_t>(end - 8);
  } else if (key.size() >= 4) {
    rest = load<std::uint32_t>(bytes) | std::uint64_t{load<std::uint32_t>(end - 4)} << 32;
  } else {
    for (; bytes != end; ++bytes) rest = rest << 8 | static_cast<unsigned char>(*bytes);
  }
  hash = mix(hash ^ rest, kFactor);
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
