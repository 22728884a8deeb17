// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Instants as text, in UTC: 2026-11-22T04:00:00Z. Years beyond 9999 have more digits, years before
// year 0 a minus.
#pragma once

#include <optional>
#include <string>
#include <string_view>

namespace base {

// Seconds since 1970; fractions and what lies beyond 10^14 seconds as civilFromSeconds has it.
void appendTimestamp(std::string& out, double secondsSince1970);

// None unless the text has that form, names a true date and time, and lies within 10^14 seconds.
std::optional<double> secondsFromTimestamp(std::string_view text);

}  // namespace base
