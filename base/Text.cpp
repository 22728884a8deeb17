// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "base/Text.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <cmath>
#include <cstdio>

namespace base {

std::string vformat(const char* format, std::va_list arguments) {
  std::array<char, 256> small;
  std::va_list again;
  va_copy(again, arguments);
  const int length = std::vsnprintf(small.data(), small.size(), format, arguments);
  std::string text;
  if (length > 0) {
    const auto size = static_cast<std::size_t>(length);
    if (size < small.size()) {
      text.assign(small.data(), size);
    } else {
      text.resize(size);
      std::vsnprintf(text.data(), size + 1, format, again);
    }
  }
  va_end(again);
  return text;
}

std::string format(const char* format, ...) {
  std::va_list arguments;
  va_start(arguments, format);
  std::string text = vformat(format, arguments);
  va_end(arguments);
  return text;
}

std::string doubleText(double value) {
  if (std::isnan(value)) return "nan";
  std::array<char, 32> text;
  const auto end =
      std::to_chars(text.data(), text.data() + text.size(), value, std::chars_format::general, 16);
  return {text.data(), end.ptr};
}

char* writeInteger(char* to, std::int64_t value) {
  return std::to_chars(to, to + kMaxNumberLength, value).ptr;
}
char* writeInteger(char* to, std::uint64_t value) {
  return std::to_chars(to, to + kMaxNumberLength, value).ptr;
}

char* writeReal(char* to, double value) {
  // Not-a-number has a sign that nobody wants to read.
  if (std::isnan(value)) return std::copy_n("nan", 3, to);
  return std::to_chars(to, to + kMaxNumberLength, value).ptr;
}

namespace {

template <typename Number>
void append(std::string& text, Number value, char* (*write)(char*, Number)) {
  std::array<char, kMaxNumberLength> digits;
  text.append(digits.data(), write(digits.data(), value));
}

}  // namespace

void appendInteger(std::string& text, std::int64_t value) { append(text, value, writeInteger); }
void appendInteger(std::string& text, std::uint64_t value) { append(text, value, writeInteger); }
void appendReal(std::string& text, double value) { append(text, value, writeReal); }

}  // namespace base
