// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/decode/Hex.h"

#include <algorithm>

namespace NANDInfo {

HexNumber hexByte(std::string_view text) {
  HexNumber byte;
  for (const char given : text.substr(0, 2)) {
    const char character = given >= 'A' && given <= 'Z' ? static_cast<char>(given + 32) : given;
    byte.value *= 16;
    if (character >= '0' && character <= '9') {
      byte.value += static_cast<std::uint32_t>(character - '0');
    } else if (character >= 'a' && character <= 'f') {
      byte.value += static_cast<std::uint32_t>(character - 'a' + 10);
    } else {
      (byte.complaint += "unrecognized hex character: ") += character;
    }
  }
  return byte;
}

HexNumber hexNumber(std::string_view text) {
  HexNumber number;
  text = text.substr(0, 8);
  for (; !text.empty(); text.remove_prefix(std::min<std::size_t>(text.size(), 2))) {
    const HexNumber byte = hexByte(text);
    number.value |= byte.value << 8 * ((text.size() - 1) / 2);
    number.complaint += byte.complaint;
  }
  return number;
}

}  // namespace NANDInfo
