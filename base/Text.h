// Texts from printf formats and from numbers.
#pragma once

#include <cstdarg>
#include <cstdint>
#include <string>

#include "base/Exported.h"

namespace MORVEND_EXPORTED base {

std::string format(const char* format, ...) __attribute__((format(printf, 1, 2)));
std::string vformat(const char* format, std::va_list arguments)
    __attribute__((format(printf, 1, 0)));

// The text of "%.16g": integral values without a decimal point, "inf", "-inf", "nan".
std::string doubleText(double value);

// Appends the decimal digits of an integer.
void appendInteger(std::string& text, std::int64_t value);
void appendInteger(std::string& text, std::uint64_t value);

// Appends the shortest text that reads back as the same double: "inf", "-inf", "nan" for the rest.
void appendReal(std::string& text, double value);

}  // namespace base
