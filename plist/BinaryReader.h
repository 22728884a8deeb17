// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Property lists from their binary encoding, version 00.
//
// A file is a header, objects, a table of the objects' offsets, and a trailer that says how wide
// offsets and object references are, how many objects there are, which one is the top level and
// where the table begins. Containers hold references. Everything is big-endian. Read by hand: there
// is no library for it alone.
#pragma once

#include <string_view>

#include "base/Result.h"
#include "plist/Value.h"

namespace plist {

// Reads any bytes whatsoever: every range is checked, references that lead back to their own
// container are refused, and what shared objects expand to is bounded. Text that isn't well-formed
// gets U+FFFD. The error names the offset.
base::Result<Value> readBinary(std::string_view bytes);

}  // namespace plist
