// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The texts that a user names counters, days and values with. Pure functions; errors say what was
// wrong with which text.
#pragma once

#include <cstdint>
#include <string_view>

#include "base/Result.h"

namespace pelloran {

// Whether a key is sound: 1 to 1,024 bytes of UTF-8 without a NUL.
base::Result<void> checkKey(std::string_view key);

// A day number, a date such as "2026-11-22", or "today" or "yesterday"; none before 1970.
base::Result<std::int32_t> parseDay(std::string_view text, std::int32_t today);

base::Result<std::int64_t> parseInteger(std::string_view text);

// A finite number.
base::Result<double> parseReal(std::string_view text);

// An integral number of the range as a 64-bit integer.
base::Result<std::int64_t> integral(double value);

// A second within a day.
base::Result<std::int32_t> secondInDay(std::int64_t second);

// A day number, from 0.
base::Result<std::int32_t> dayOf(std::int64_t number);

}  // namespace pelloran
