// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Text for people: headings, names and bars, as wide as the terminal.
#pragma once

#include <cstdint>
#include <span>
#include <string>
#include <string_view>
#include <vector>

namespace demo {

// The blanks before each line of a section.
inline constexpr std::size_t kIndent = 2;

// The columns of the terminal, neither few nor very many.
std::size_t screenWidth();

// A line that begins a section; bold on a terminal.
std::string heading(std::string_view text);

// A key without the beginning that nearly all have: "~" stands for "com.norba".
std::string shortKey(std::string_view key);

// Names one after the other, in indented lines.
std::string wrapped(const std::vector<std::string>& names);

// A bar for a share of 1, `width` columns long for all of it, in steps of an eighth of a column.
// What is more than nothing is seen.
std::string bar(double share, std::size_t width);

// One block for each count, as high as its share of the largest.
std::string skyline(std::span<const std::uint64_t> counts);

// Up to `most` indices below `count`, evenly spread, ascending.
std::vector<std::size_t> evenlySpread(std::size_t count, std::size_t most);

}  // namespace demo
