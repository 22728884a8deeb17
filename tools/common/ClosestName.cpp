// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/common/ClosestName.h"

#include <algorithm>
#include <cstddef>
#include <numeric>
#include <vector>

namespace tools {

namespace {

// The number of letters to change, add, remove or swap with the next one, each letter once.
std::size_t distance(std::string_view a, std::string_view b) {
  std::vector<std::size_t> beforeLast, last, row(b.size() + 1);
  std::iota(row.begin(), row.end(), std::size_t{0});
  for (std::size_t i = 1; i <= a.size(); ++i) {
    beforeLast = std::move(last);
    last = row;
    row[0] = i;
    for (std::size_t j = 1; j <= b.size(); ++j) {
      row[j] = std::min({last[j] + 1, row[j - 1] + 1, last[j - 1] + (a[i - 1] != b[j - 1])});
      if (i > 1 && j > 1 && a[i - 1] == b[j - 2] && a[i - 2] == b[j - 1]) {
        row[j] = std::min(row[j], beforeLast[j - 2] + 1);
      }
    }
  }
  return row.back();
}

}  // namespace

std::string_view closestName(std::string_view typed, std::span<const std::string_view> names) {
  constexpr std::size_t kMaxLength = 64, kMaxDistance = 2;
  std::string_view closest;
  std::size_t least = std::min(kMaxDistance + 1, typed.size());  // not every letter
  if (typed.size() > kMaxLength) return {};
  for (const std::string_view name : names) {
    const std::size_t apart = distance(typed, name);
    if (apart >= least) continue;
    least = apart;
    closest = name;
  }
  return closest;
}

}  // namespace tools
