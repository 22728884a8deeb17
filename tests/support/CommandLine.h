// The arguments of a program that is run within a test.
#pragma once

#include <string>
#include <vector>

namespace support {

// Parted by one blank each: two in a row have an empty argument between them.
inline std::vector<std::string> argumentsOf(const std::string& line) {
  std::vector<std::string> arguments(1);
  for (const char c : line) {
    if (c == ' ') {
      arguments.emplace_back();
    } else {
      arguments.back() += c;
    }
  }
  return arguments;
}

}  // namespace support
