// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Text as UTF-8, and its way into formats that can't hold every character.
#pragma once

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string>
#include <string_view>

namespace base {

// U+FFFD, which stands for what can't be text.
inline constexpr std::string_view kReplacementCharacter = "\xEF\xBF\xBD";

struct Character {
  char32_t code;
  std::size_t length;  // in bytes, 1 to 4; 0: the text doesn't begin with well-formed UTF-8

  // Neither malformed nor U+FFFE or U+FFFF, which are never characters.
  bool isSound() const { return length > 0 && code != 0xFFFE && code != 0xFFFF; }
};

// What a non-empty text begins with.
Character firstCharacter(std::string_view text);

// The length of what a non-empty text begins with; 0 when that isn't sound.
inline std::size_t characterLength(std::string_view text) {
  const Character character = firstCharacter(text);
  return character.isSound() ? character.length : 0;
}

// Whether a text holds nothing but characters that XML 1.0 can hold, so that it is written as it
// is.
bool isWritable(std::string_view text);

// A text as it is written: itself if it is writable, else made in `room`, with U+FFFD for each
// character that XML 1.0 forbids and for each byte that is not part of a character. What reads a
// text that comes from outside takes it through this: then what is compared is what is written.
std::string_view writable(std::string_view text, std::string& room);

// Appends a character, as UTF-8; U+FFFD for what isn't one, or can't be written.
void appendCharacter(std::string& out, char32_t character);

// The ASCII characters that a format can't hold as they are.
class EscapedCharacters {
 public:
  // All control characters but those in `plain`, and those in `escaped`.
  constexpr EscapedCharacters(std::string_view plain, std::string_view escaped)
      : escaped_(escaped) {
    for (std::size_t c = 0; c < 0x20; ++c) stops_[c] = true;
    for (std::size_t c = 0x80; c < 0x100; ++c) stops_[c] = true;
    for (const char c : plain) stops_[static_cast<unsigned char>(c)] = false;
    for (const char c : escaped) stops_[static_cast<unsigned char>(c)] = true;
  }

  // Whether a run of plain bytes ends here: at an escaped character, or at one that isn't ASCII.
  bool stopsAt(char byte) const { return stops_[static_cast<unsigned char>(byte)]; }

  // Whether the whole of a text is written as it is.
  bool isPlain(std::string_view text) const {
    std::size_t i = 0;
    for (; text.size() - i >= 8; i += 8) {
      if (stopsAmongEight(text.data() + i)) return false;
    }
    for (; i < text.size(); ++i) {
      if (stopsAt(text[i])) return false;
    }
    return true;
  }

  // Whether a run may end among eight bytes: surely not, if this says no.
  bool stopsAmongEight(const char* bytes) const {
    std::uint64_t word = 0;
    std::memcpy(&word, bytes, sizeof word);
    constexpr std::uint64_t ones = 0x0101010101010101;
    std::uint64_t stops = (word - 0x20 * ones) | word;
    for (const char c : escaped_) {
      const std::uint64_t zeroWhereEqual = word ^ static_cast<unsigned char>(c) * ones;
      stops |= (zeroWhereEqual - ones) & ~zeroWhereEqual;
    }
    return (stops & 0x80 * ones) != 0;
  }

 private:
  std::string_view escaped_;
  std::array<bool, 256> stops_{};
};

// Appends a text; `escape(out, c)` appends each escaped ASCII character. U+FFFE and U+FFFF become
// U+FFFD, and so does each byte that is not part of well-formed UTF-8.
template <typename Escape>
void appendEscaped(std::string& out, std::string_view text, const EscapedCharacters& escaped,
                   Escape escape) {
  std::size_t begin = 0;  // of the run that is to be appended next
  for (std::size_t i = 0; i < text.size();) {
    if (text.size() - i >= 8 && !escaped.stopsAmongEight(text.data() + i)) {
      i += 8;
      continue;
    }
    if (!escaped.stopsAt(text[i])) {
      ++i;
      continue;
    }
    const Character character = firstCharacter(text.substr(i));
    const bool ascii = static_cast<unsigned char>(text[i]) < 0x80;
    const std::size_t end = i + std::max<std::size_t>(character.length, 1);
    if (ascii || !character.isSound()) {
      out.append(text, begin, i - begin);
      if (ascii) {
        escape(out, text[i]);
      } else {
        out += kReplacementCharacter;
      }
      begin = end;
    }
    i = end;
  }
  out.append(text, begin);
}

}  // namespace base
