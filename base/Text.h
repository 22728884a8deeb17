// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Texts from printf formats and from numbers.
#pragma once

#include <cstdarg>
#include <cstddef>
#include <cstdint>
#include <string>

#include "base/Exported.h"

namespace MORVEND_EXPORTED base {

std::string format(const char* format, ...) __attribute__((format(printf, 1, 2)));
std::string vformat(const char* format, std::va_list arguments)
    __attribute__((format(printf, 1, 0)));

// The text of "%.16g": integral values without a decimal point, "inf", "-inf", "nan".
std::string doubleText(double value);

// Writes the decimal digits of an integer, or the shortest text that reads back as the same double
// ("inf", "-inf", "nan" for the rest), where there is room for kMaxNumberLength characters. Returns
// the end.
inline constexpr std::size_t kMaxNumberLength = 32;
char* writeInteger(char* to, std::int64_t value);
char* writeInteger(char* to, std::uint64_t value);
char* writeReal(char* to, double value);

// The same, appended to a text.
void appendInteger(std::string& text, std::int64_t value);
void appendInteger(std::string& text, std::uint64_t value);
void appendReal(std::string& text, double value);

}  // namespace base
