// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "base/UTF8.h"

namespace base {

namespace {

constexpr EscapedCharacters kForbidden("\t\n\r", "");

}  // namespace

Character firstCharacter(std::string_view text) {
  const auto byte = [text](std::size_t i) -> char32_t {
    return i < text.size() ? static_cast<unsigned char>(text[i]) : 0;
  };
  const char32_t first = byte(0);
  if (first < 0x80) return {first, 1};
  const std::size_t length = first >= 0xF0 ? 4 : first >= 0xE0 ? 3 : 2;
  char32_t code = first & (0x7F >> length);
  for (std::size_t i = 1; i < length; ++i) {
    if ((byte(i) & 0xC0) != 0x80) return {0, 0};
    code = code << 6 | (byte(i) & 0x3F);
  }
  constexpr char32_t kLeast[] = {0x80, 0x800, 0x10000};  // of each length from 2
  const bool surrogate = code >= 0xD800 && code <= 0xDFFF;
  const bool sound =
      first >= 0xC0 && first < 0xF8 && code >= kLeast[length - 2] && !surrogate && code <= 0x10FFFF;
  return sound ? Character{code, length} : Character{0, 0};
}

bool isWritable(std::string_view text) {
  for (std::size_t i = 0; i < text.size();) {
    if (text.size() - i >= 8 && !kForbidden.stopsAmongEight(text.data() + i)) {
      i += 8;
    } else if (!kForbidden.stopsAt(text[i])) {
      ++i;
    } else {
      const Character character = firstCharacter(text.substr(i));
      if (character.code < 0x80 || !character.isSound()) return false;
      i += character.length;
    }
  }
  return true;
}

std::string_view writable(std::string_view text, std::string& room) {
  if (isWritable(text)) return text;
  room.clear();
  appendEscaped(room, text, kForbidden, [](std::string& to, char) { to += kReplacementCharacter; });
  return room;
}

void appendCharacter(std::string& out, char32_t character) {
  const auto append = [&out](char32_t byte) { out += static_cast<char>(byte); };
  const bool surrogate = character >= 0xD800 && character <= 0xDFFF;
  const bool never = character == 0xFFFE || character == 0xFFFF || character > 0x10FFFF;
  const bool forbidden =
      character < 0x20 && character != '\t' && character != '\n' && character != '\r';
  if (surrogate || never || forbidden) {
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

}  // namespace base
