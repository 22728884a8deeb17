// Results as tables for people: numbers in groups of three digits, keys aligned, nothing in a text
// that could move a terminal's cursor.
#pragma once

#include <cstddef>
#include <string>

#include "platform/PropertyList.h"

namespace nandinfo {

// A text from elsewhere as one line of a terminal may show it: "?" stands for control characters,
// U+FFFD for what isn't UTF-8.
std::string printable(std::string_view text);

// A value as lines. Dictionaries within a dictionary stand side by side, as many as `width` columns
// allow, then the next ones; rows of dictionaries are cut at that width.
std::string tableText(const platform::Value& value, std::size_t width);

}  // namespace nandinfo
