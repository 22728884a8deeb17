#include "platform/host/UTF8.h"

#include <cstdint>

namespace platform::host {

std::size_t characterLength(std::string_view text) {
  const auto byte = [text](std::size_t i) -> std::uint32_t {
    return i < text.size() ? static_cast<unsigned char>(text[i]) : 0;
  };
  const auto continues = [&](std::size_t i) { return (byte(i) & 0xC0) == 0x80; };
  const std::uint32_t first = byte(0);
  if (first < 0x80) return 1;
  if (first >= 0xC2 && first <= 0xDF) return continues(1) ? 2 : 0;
  if (first >= 0xE0 && first <= 0xEF && continues(1) && continues(2)) {
    const std::uint32_t c = (first & 0xF) << 12 | (byte(1) & 0x3F) << 6 | (byte(2) & 0x3F);
    const bool surrogate = c >= 0xD800 && c <= 0xDFFF;
    return c >= 0x800 && !surrogate && c < 0xFFFE ? 3 : 0;
  }
  if (first >= 0xF0 && first <= 0xF4 && continues(1) && continues(2) && continues(3)) {
    const std::uint32_t top = (first & 0x7) << 6 | (byte(1) & 0x3F);
    return top >= 0x10 && top <= 0x10F ? 4 : 0;
  }
  return 0;
}

void appendCharacter(std::string& out, char32_t character) {
  const auto append = [&out](char32_t byte) { out += static_cast<char>(byte); };
  const bool surrogate = character >= 0xD800 && character <= 0xDFFF;
  const bool never = character == 0xFFFE || character == 0xFFFF || character > 0x10FFFF;
  if (surrogate || never) {
    out += kReplacementCharacter;
  } else if (character < 0x80) {
    append(character);
  } else if (character < 0x800) {
    append(0xC0 | character >> 6);
    append(0x80 | (character & 0x3F));
  } else if (character < 0x10000) {
    append(0xE0 | character >> 12);
    append(0x80 | (character >> 6 & 0x3F));
    append(0x80 | (character & 0x3F));
  } else {
    append(0xF0 | character >> 18);
    append(0x80 | (character >> 12 & 0x3F));
    append(0x80 | (character >> 6 & 0x3F));
    append(0x80 | (character & 0x3F));
  }
}

}  // namespace platform::host
