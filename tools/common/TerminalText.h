// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Texts from elsewhere on a terminal: nothing in them moves the cursor.
#pragma once

#include <string>
#include <string_view>

namespace tools {

// A text as one line of a terminal may show it: "?" stands for each control character, and for
// those that turn the direction of writing; U+FFFD for what isn't UTF-8.
std::string printable(std::string_view text);

// JSON in which the control characters that it may hold as they are, are escaped: those beyond
// ASCII, which some terminals obey, and the one at its end.
std::string printableJSON(std::string json);

}  // namespace tools
