// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// For who mistypes a name.
#pragma once

#include <span>
#include <string_view>

namespace tools {

// The name that is meant, if it is one or two letters away: changed, missing, added or swapped with
// its neighbour. Empty when none is; the first of those that are as close.
std::string_view closestName(std::string_view typed, std::span<const std::string_view> names);

}  // namespace tools
