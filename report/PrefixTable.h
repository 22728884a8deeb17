// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// A set of key prefixes, each with its options, in which the longest prefix of a key is found in
// time proportional to the key's length, however many prefixes there are.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "report/OptionsTable.h"

namespace report {

class PrefixTable {
 public:
  struct Match {
    std::string_view prefix;        // the part of the key that matched
    const CounterOptions* options;  // borrowed; null when no prefix matches
  };

  explicit PrefixTable(OptionsTable prefixes = {});
  PrefixTable(PrefixTable&&) = default;
  PrefixTable& operator=(PrefixTable&&) = default;

  Match longestPrefix(std::string_view key) const;

 private:
  // A node of the tree: the texts below it share what leads to it, its label last. Its children
  // stand together and differ in their labels' first bytes.
  struct Node {
    std::string_view label;
    const CounterOptions* options;
    std::uint32_t firstChild, childCount;
  };

  OptionsTable prefixes_;    // owns the texts and the options
  std::vector<Node> nodes_;  // the root first, its label empty
  std::string firstBytes_;   // of each node's label
};

}  // namespace report
