// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Dictionaries in which a key stands once when they are written.
#pragma once

#include <optional>

#include "plist/Value.h"

namespace plist {

// None if each key can be written as it is, which is so wherever they come from outside; otherwise
// the dictionary with its keys as they are written: of those that become the same the last counts.
std::optional<Dictionary> withWritableKeys(const Dictionary& dictionary);

}  // namespace plist
