// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Results as tables for people: numbers in groups of three digits, keys aligned, nothing in a text
// that could move a terminal's cursor.
#pragma once

#include <cstddef>
#include <string>

#include "plist/Value.h"

namespace nandinfo {

// A value as lines. Dictionaries within a dictionary stand side by side, as many as `width` columns
// allow, then the next ones, after them those that hold arrays or dictionaries themselves, one by
// one; rows of dictionaries are cut at that width.
std::string tableText(const plist::Value& value, std::size_t width);

}  // namespace nandinfo
