// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Names that begin alike, and how the tables write them: "padSizes_{0..3}" is a stem and, in its
// braces, what may follow: a text, or a text and each number of a range. "{A0..2, B}" after a stem
// stands for four names.
#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "NANDInfo/NameTable.h"

namespace NANDInfo {

// What stands before the braces: the whole of a name that has none.
constexpr std::string_view familyStem(std::string_view family) {
  return family.substr(0, family.find('{'));
}

constexpr bool hasBraces(std::string_view family) { return family.ends_with('}'); }

// What follows a stem: a text and, after it, each of `count` numbers; no number when it is 0.
struct FamilyItem {
  std::string_view text;
  std::uint32_t first = 0, count = 0;
};

// Calls visit(item) for each item in the braces.
template <typename Visit>
constexpr void visitItems(std::string_view braces, Visit visit) {
  const auto numberAt = [&braces](std::size_t place) {
    std::uint32_t number = 0;
    for (; braces[place] >= '0' && braces[place] <= '9'; ++place) {
      number = 10 * number + static_cast<std::uint32_t>(braces[place] - '0');
    }
    return number;
  };
  for (std::size_t begin = 1, end = 0; begin < braces.size(); begin = end + 2) {
    end = std::min(braces.find(',', begin), braces.size() - 1);
    const std::string_view text = braces.substr(begin, end - begin);
    const std::size_t dots = text.find("..");
    if (dots == std::string_view::npos) {
      visit(FamilyItem{text});
      continue;
    }
    const std::size_t digits = text.find_last_not_of("0123456789", dots - 1) + 1;
    const std::uint32_t first = numberAt(begin + digits);
    visit(FamilyItem{text.substr(0, digits), first, numberAt(begin + dots + 2) - first + 1});
  }
}

// Calls visit(item) for each item of a row; a name that has none is one with nothing after it.
template <typename Visit>
constexpr void visitItems(const NameRow& row, Visit visit) {
  const std::string_view family = row.family;
  if (row.items != nullptr) {
    visitItems(std::string_view(row.items), visit);
  } else if (hasBraces(family)) {
    visitItems(family.substr(familyStem(family).size()), visit);
  } else {
    visit(FamilyItem{"", 0, row.elements > 1 ? row.elements : 0u});
  }
}

// How many names a row stands for.
constexpr std::size_t familySize(const NameRow& row) {
  std::size_t size = 0;
  visitItems(row, [&size](const FamilyItem& item) { size += std::max(item.count, 1u); });
  return size;
}

// The names of one row, in its order.
std::vector<std::string> expandNames(const NameRow& row);

}  // namespace NANDInfo
