// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The arguments of a program that is run within a test.
#pragma once

#include <string>
#include <utility>
#include <vector>

namespace support {

using Arguments = std::vector<std::string>;

// Parted by one blank each: two in a row have an empty argument between them.
inline Arguments argumentsOf(const std::string& line) {
  Arguments arguments(1);
  for (const char c : line) {
    if (c == ' ') {
      arguments.emplace_back();
    } else {
      arguments.back() += c;
    }
  }
  return arguments;
}

// Command lines by their beginnings, with what follows.
inline std::vector<Arguments> argumentsOf(
    const std::vector<std::pair<std::string, std::vector<std::string>>>& lines) {
  std::vector<Arguments> all;
  for (const auto& [beginning, rests] : lines) {
    for (const std::string& rest : rests) all.push_back(argumentsOf(beginning + rest));
  }
  return all;
}

}  // namespace support
