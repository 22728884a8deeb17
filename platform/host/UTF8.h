// Text as UTF-8, and its way into formats that can't hold every character.
#pragma once

#include <array>
#include <cstddef>
#include <string>
#include <string_view>

namespace platform::host {

// U+FFFD, which stands for what can't be text.
inline constexpr std::string_view kReplacementCharacter = "\xEF\xBF\xBD";

// The length, 1 to 4, of the character that a non-empty text begins with. 0 when the text doesn't
// begin with well-formed UTF-8, or begins with U+FFFE or U+FFFF, which are never characters.
std::size_t characterLength(std::string_view text);

// Appends a character, as UTF-8; U+FFFD for what isn't one.
void appendCharacter(std::string& out, char32_t character);

// The ASCII characters that a format can't hold as they are.
class EscapedCharacters {
 public:
  constexpr EscapedCharacters() : EscapedCharacters({}, {}) {
    for (std::size_t c = 0; c < 0x20; ++c) stops_[c] = false;
  }

  // All control characters but those in `plain`, and those in `escaped`.
  constexpr EscapedCharacters(std::string_view plain, std::string_view escaped) {
    for (std::size_t c = 0; c < 0x20; ++c) stops_[c] = true;
    for (std::size_t c = 0x80; c < 0x100; ++c) stops_[c] = true;
    for (const char c : plain) stops_[static_cast<unsigned char>(c)] = false;
    for (const char c : escaped) stops_[static_cast<unsigned char>(c)] = true;
  }

  // Whether a run of plain bytes ends here: at an escaped character, or at one that isn't ASCII.
  bool stopsAt(char byte) const { return stops_[static_cast<unsigned char>(byte)]; }

  // The same for any of eight bytes, with one branch for all of them.
  bool stopsAmongEight(const char* bytes) const {
    bool stops = false;
    for (int i = 0; i < 8; ++i) stops |= stopsAt(bytes[i]);
    return stops;
  }

 private:
  std::array<bool, 256> stops_{};
};

// Appends a text; `escape(out, c)` appends each escaped ASCII character, and each byte that is not
// part of a character becomes U+FFFD.
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
    const bool ascii = static_cast<unsigned char>(text[i]) < 0x80;
    if (const std::size_t length = ascii ? 0 : characterLength(text.substr(i)); length > 0) {
      i += length;
      continue;
    }
    out.append(text, begin, i - begin);
    if (ascii) {
      escape(out, text[i]);
    } else {
      out += kReplacementCharacter;
    }
    begin = ++i;
  }
  out.append(text, begin);
}

}  // namespace platform::host
