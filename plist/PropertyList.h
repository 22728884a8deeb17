// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Property lists as bytes: read, and by XMLWriter.h written.
#pragma once

#include <cstddef>
#include <string_view>

#include "base/Result.h"
#include "plist/Value.h"
#include "plist/XMLWriter.h"

namespace plist {

// Longer property lists are refused.
inline constexpr std::size_t kMaxSize = std::size_t{16} << 20;

// So are those that hold more values, each counted in every place in which it appears, or that
// would take more memory, by and large.
inline constexpr std::size_t kMaxValues = 2'000'000;
inline constexpr std::size_t kMaxMemory = std::size_t{96} << 20;

// The memory that a value takes, by and large.
std::size_t memoryOf(const Value& value);

// Reads either encoding: what begins with "bplist" is binary, everything else XML. The error names
// the place: a line or an offset. Integers become int64, or uint64 where they are larger; reals of
// four bytes float, others double.
base::Result<Value> read(std::string_view bytes);

}  // namespace plist
