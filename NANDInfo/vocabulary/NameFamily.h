// Walks the names of a family; for the tables, which count their names while they are compiled.
#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <string_view>

namespace NANDInfo {

// What stands before the braces: the whole of a name that has none.
constexpr std::string_view familyStem(std::string_view family) {
  return family.substr(0, family.find('{'));
}

// Calls visit(first, last) for each range of numbers in the braces; one number is a range too.
template <typename Visit>
constexpr void visitRanges(std::string_view family, Visit visit) {
  std::string_view rest = family.substr(familyStem(family).size());
  const auto takeNumber = [&rest] {
    rest.remove_prefix(std::min(rest.find_first_of("0123456789"), rest.size()));
    std::uint32_t number = 0;
    for (; !rest.empty() && rest[0] >= '0' && rest[0] <= '9'; rest.remove_prefix(1)) {
      number = 10 * number + static_cast<std::uint32_t>(rest[0] - '0');
    }
    return number;
  };
  while (rest.size() > 1) {
    const std::uint32_t first = takeNumber();
    visit(first, rest.starts_with("..") ? takeNumber() : first);
  }
}

// How many names a family stands for.
constexpr std::size_t familySize(std::string_view family) {
  std::size_t size = 0;
  visitRanges(family,
              [&size](std::uint32_t first, std::uint32_t last) { size += last - first + 1; });
  return family.find('{') == std::string_view::npos ? 1 : size;
}

}  // namespace NANDInfo
