// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The flash validity list: how much of the flash still holds valid data, as sixteen short lists.
//
// Little-endian: the number of records and the place of the first one in units of 8 bytes, 32 bits
// each; then records of five 32-bit words, the fourth of them the index of a list, the last a value
// for it.
#pragma once

#include <array>
#include <cstddef>
#include <span>

#include "base/Exported.h"
#include "base/Result.h"
#include "plist/Value.h"

namespace MORVEND_EXPORTED NANDInfo {

using ValidityLists = std::array<plist::Array, 16>;

// The values of each list, in record order; records of other lists are left out. Fails when
// there are no records or they don't all fit.
base::Result<ValidityLists> parseValidityList(std::span<const std::byte> buffer);

}  // namespace NANDInfo
