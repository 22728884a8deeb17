#include "tools/common/TerminalText.h"

#include <algorithm>
#include <iterator>

#include "base/Text.h"
#include "base/UTF8.h"

namespace tools {

namespace {

struct Range {
  char32_t first, last;
  constexpr bool operator<(char32_t character) const { return last < character; }
};

// Each table in ascending order.
constexpr Range kCombining[] = {
    {0x300, 0x36F},   {0x483, 0x489},   {0x591, 0x5BD},     {0x610, 0x61A},     {0x64B, 0x65F},
    {0x6D6, 0x6DC},   {0x900, 0x902},   {0x93C, 0x93C},     {0x941, 0x948},     {0xE31, 0xE31},
    {0xE34, 0xE3A},   {0xE47, 0xE4E},   {0x1AB0, 0x1AFF},   {0x1DC0, 0x1DFF},   {0x200B, 0x200D},
    {0x2060, 0x2064}, {0x20D0, 0x20F0}, {0x302A, 0x302D},   {0x3099, 0x309A},   {0xFE00, 0xFE0F},
    {0xFE20, 0xFE2F}, {0xFEFF, 0xFEFF}, {0x1F3FB, 0x1F3FF}, {0xE0100, 0xE01EF},
};
constexpr Range kWide[] = {
    {0x1100, 0x115F},   {0x231A, 0x231B},   {0x2E80, 0x303E},   {0x3041, 0x33FF},
    {0x3400, 0x4DBF},   {0x4E00, 0x9FFF},   {0xA000, 0xA4CF},   {0xAC00, 0xD7A3},
    {0xF900, 0xFAFF},   {0xFE30, 0xFE6F},   {0xFF00, 0xFF60},   {0xFFE0, 0xFFE6},
    {0x1F300, 0x1F64F}, {0x1F680, 0x1F6FF}, {0x1F900, 0x1F9FF}, {0x20000, 0x3FFFD},
};
constexpr Range kControls[] = {
    {0x80, 0x9F}, {0x200E, 0x200F}, {0x2028, 0x202E}, {0x2066, 0x2069}, {0xE0001, 0xE007F}};

template <std::size_t count>
bool isIn(const Range (&table)[count], char32_t character) {
  const Range* found = std::lower_bound(std::begin(table), std::end(table), character);
  return found != std::end(table) && found->first <= character;
}

// The character at the beginning of a text that isn't empty, and its bytes; U+FFFD and one byte for
// what isn't UTF-8.
struct Character {
  char32_t code;
  std::size_t length;
};
Character firstOf(std::string_view text) {
  const std::size_t length = base::characterLength(text);
  if (length == 0) return {0xFFFD, 1};
  const auto byte = [text](std::size_t at) { return static_cast<unsigned char>(text[at]); };
  if (length == 1) return {byte(0), 1};
  char32_t code = byte(0) & (0xFFu >> (length + 1));
  for (std::size_t i = 1; i < length; ++i) code = code << 6 | (byte(i) & 0x3Fu);
  return {code, length};
}

std::size_t columnsOf(char32_t character) {
  if (character < 0x300) return 1;
  return isIn(kCombining, character) ? 0 : isIn(kWide, character) ? 2 : 1;
}

}  // namespace

std::string printable(std::string_view text) {
  std::string shown;
  shown.reserve(text.size());
  while (!text.empty()) {
    const auto [code, length] = firstOf(text);
    if (code < 0x20 || code == 0x7F || isIn(kControls, code)) {
      shown += '?';
    } else if (code == 0xFFFD) {
      shown += base::kReplacementCharacter;
    } else {
      shown += text.substr(0, length);
    }
    text.remove_prefix(length);
  }
  return shown;
}

std::size_t columnsOf(std::string_view text) {
  std::size_t columns = 0;
  while (!text.empty()) {
    const auto [code, length] = firstOf(text);
    columns += columnsOf(code);
    text.remove_prefix(length);
  }
  return columns;
}

std::string cutToColumns(std::string text, std::size_t most) {
  std::size_t columns = 0, kept = 0;  // kept: the bytes that leave a column for the ellipsis
  for (std::size_t at = 0; at < text.size();) {
    const auto [code, length] = firstOf(std::string_view(text).substr(at));
    columns += columnsOf(code);
    if (columns > most) {
      text.resize(kept);
      return text + "\xE2\x80\xA6";
    }
    at += length;
    if (columns < most) kept = at;
  }
  return text;
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
