// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Values as JSON text. Written by hand: in the order of the entries, at the speed of appending.
#pragma once

#include <string>

#include "plist/Value.h"

namespace plist {

// Appends the JSON form of a value, on one line: {"type": 176, "names": ["a", "b"]}. A real always
// has a fraction or an exponent, not-a-number and the infinities are null, dates are timestamps in
// UTC, data base64 text. What isn't UTF-8 becomes U+FFFD, so that the text is always valid.
void appendJSON(std::string& out, const Value& value);

// The same for people to read, without a line feed at its end: each entry of a dictionary on a line
// of its own, and each element of an array that holds arrays or dictionaries.
void appendIndentedJSON(std::string& out, const Value& value);

}  // namespace plist
