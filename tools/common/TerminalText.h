// Texts from elsewhere on a terminal: nothing in them moves the cursor, and tables know how wide
// they are.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>

namespace tools {

// A text as one line of a terminal may show it: "?" stands for each control character, and for
// those that turn the direction of writing; U+FFFD for what isn't UTF-8.
std::string printable(std::string_view text);

// JSON in which the control characters that it may hold as they are, are escaped: those beyond
// ASCII, which some terminals obey, and the one at its end.
std::string printableJSON(std::string json);

// The columns that a printable text takes: two for a wide character, none for one that combines
// with the one before.
std::size_t columnsOf(std::string_view text);

// The beginning of a printable text that takes at most so many columns; "…" stands for what is cut.
std::string cutToColumns(std::string text, std::size_t most);

}  // namespace tools
