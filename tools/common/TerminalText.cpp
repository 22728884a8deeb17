// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/common/TerminalText.h"

#include <algorithm>
#include <cstddef>

#include "base/Text.h"
#include "base/UTF8.h"

namespace tools {

namespace {

// Control characters, and what turns the direction of writing.
bool isControl(char32_t character) {
  constexpr struct {
    char32_t first, last;
  } kControls[] = {{0x0, 0x1F},      {0x7F, 0x9F},     {0x200E, 0x200F},
                   {0x2028, 0x202E}, {0x2066, 0x2069}, {0xE0001, 0xE007F}};
  return std::ranges::any_of(kControls, [character](const auto& range) {
    return range.first <= character && character <= range.last;
  });
}

}  // namespace

std::string printable(std::string_view text) {
  std::string shown;
  shown.reserve(text.size());
  while (!text.empty()) {
    const base::Character character = base::firstCharacter(text);
    const std::size_t length = character.isSound() ? character.length : 1;
    if (!character.isSound()) {
      shown += base::kReplacementCharacter;
    } else if (isControl(character.code)) {
      shown += '?';
    } else {
      shown += text.substr(0, length);
    }
    text.remove_prefix(length);
  }
  return shown;
}

std::string printableJSON(std::string json) {
  for (std::size_t i = 0; (i = json.find_first_of("\x7f\xC2", i)) != std::string::npos; ++i) {
    const bool ascii = json[i] == '\x7f';
    const auto code = static_cast<unsigned char>(json[ascii ? i : i + 1]);
    if (ascii || code < 0xA0) json.replace(i, ascii ? 1 : 2, base::format("\\u%04x", code));
  }
  return json;
}

}  // namespace tools
