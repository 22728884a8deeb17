// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Finds the places of keys in a list of entries that somebody else keeps: open addressing over the
// keys' hashes.
#pragma once

#include <bit>
#include <cstdint>
#include <string_view>
#include <vector>

#include "base/Exported.h"

namespace MORVEND_EXPORTED base {

// Seeded for each process: keys come from files and messages, and nobody outside shall be able to
// choose keys that collide.
std::uint32_t keyHash(std::string_view key);

class KeyIndex {
 public:
  static constexpr std::uint32_t kNone = UINT32_MAX;

  // An index with room for this many keys; it grows beyond.
  explicit KeyIndex(std::size_t keys = 0) : slots_(std::bit_ceil(2 * keys + 8), Slot{0, 0}) {}

  // The place of the key with this hash, or kNone; `isAt(place)` tells whether the key stands
  // there.
  template <typename IsAt>
  std::uint32_t find(std::uint32_t hash, IsAt isAt) const {
    const std::size_t mask = slots_.size() - 1;
    for (std::size_t i = hash & mask; slots_[i].placeAfter != 0; i = (i + 1) & mask) {
      if (slots_[i].hash == hash && isAt(slots_[i].placeAfter - 1)) return slots_[i].placeAfter - 1;
    }
    return kNone;
  }

  // The same; a key that isn't there is added, with this place.
  template <typename IsAt>
  std::uint32_t findOrInsert(std::uint32_t hash, std::uint32_t place, IsAt isAt) {
    makeRoom();
    const std::size_t mask = slots_.size() - 1;
    std::size_t i = hash & mask;
    for (; slots_[i].placeAfter != 0; i = (i + 1) & mask) {
      if (slots_[i].hash == hash && isAt(slots_[i].placeAfter - 1)) return slots_[i].placeAfter - 1;
    }
    slots_[i] = {hash, place + 1};
    ++taken_;
    return kNone;
  }

  // Adds a key that is not there.
  void insert(std::uint32_t hash, std::uint32_t place) {
    findOrInsert(hash, place, [](std::uint32_t) { return false; });
  }

 private:
  struct Slot {
    std::uint32_t hash;
    std::uint32_t placeAfter;  // the place plus one; 0 is a free slot
  };

  // Doubles the slots when one more would take over half of them.
  void makeRoom() {
    if (2 * (taken_ + 1) > slots_.size()) grow();
  }
  void grow();

  std::vector<Slot> slots_;  // a power of two, at most half of them taken
  std::size_t taken_ = 0;
};

}  // namespace base
