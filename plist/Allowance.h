// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What one property list may become in memory, whatever its bytes say: both readers take of it
// before they make anything.
#pragma once

#include <cstddef>
#include <string>

#include "plist/PropertyList.h"
#include "plist/Value.h"

namespace plist {

// A dictionary, and an array of which nobody said the size, make room for a few at their first.
inline constexpr std::size_t kUsualDictionarySize = 4;
inline constexpr std::size_t kUsualArraySize = 8;

class Allowance {
 public:
  // Values for which a container has room, in each place in which they appear.
  bool takeElements(std::size_t count) { return takeValues(count, sizeof(Value)); }
  bool takeEntries(std::size_t count) { return takeValues(count, sizeof(Dictionary::Entry)); }

  // Elements or entries for which a container that isn't empty makes room beyond those it has.
  bool takeUnusedElements(std::size_t count) {
    return takeBytes(count * sizeof(Value) + kOverhead);
  }
  bool takeUnusedEntries(std::size_t count) {
    return takeBytes(count * sizeof(Dictionary::Entry) + kOverhead);
  }

  // The bytes of a text, a key or data; short ones have their place in the value.
  bool takeContent(std::size_t size) {
    return size < sizeof(std::string) / 2 || takeBytes(size + kOverhead);
  }

 private:
  static constexpr std::size_t kOverhead = 16;  // of each piece of memory

  bool takeValues(std::size_t count, std::size_t size) {
    if (count > values_) return false;
    values_ -= count;
    return takeBytes(count * size);
  }

  bool takeBytes(std::size_t bytes) {
    if (bytes > bytes_) return false;
    bytes_ -= bytes;
    return true;
  }

  std::size_t values_ = kMaxValues;
  std::size_t bytes_ = kMaxMemory;
};

}  // namespace plist
