// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Hexadecimal texts as numbers.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

namespace NANDInfo {

struct HexNumber {
  std::uint32_t value = 0;
  std::string complaint;  // of each character that isn't hexadecimal and adds nothing
};

// At most two characters as a byte.
HexNumber hexByte(std::string_view text);

// At most eight characters, in pairs; a lone one at the end is the lowest byte by itself.
HexNumber hexNumber(std::string_view text);

}  // namespace NANDInfo
