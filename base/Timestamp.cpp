// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "base/Timestamp.h"

#include <charconv>
#include <cmath>

#include "base/CivilDate.h"
#include "base/Text.h"

namespace base {

void appendTimestamp(std::string& out, double secondsSince1970) {
  const CivilTime t = civilFromSeconds(secondsSince1970);
  const long long year = t.date.year;
  out += format("%s%04lld-%02d-%02dT%02d:%02d:%02dZ", year < 0 ? "-" : "", std::abs(year),
                t.date.month, t.date.day, t.hour, t.minute, t.second);
}

std::optional<double> secondsFromTimestamp(std::string_view text) {
  constexpr std::string_view kTail = "-00-00T00:00:00Z";
  constexpr std::size_t kMinYearDigits = 4, kMaxYearDigits = 7;  // of the year
  const bool negative = text.starts_with('-');
  if (negative) text.remove_prefix(1);
  if (text.size() < kTail.size() + kMinYearDigits) return std::nullopt;
  const std::size_t tail = text.size() - kTail.size();
  if (tail > kMaxYearDigits) return std::nullopt;
  for (std::size_t i = 0; i < text.size(); ++i) {
    const char expected = i < tail ? '0' : kTail[i - tail];
    const bool digit = text[i] >= '0' && text[i] <= '9';
    if (expected == '0' ? !digit : text[i] != expected) return std::nullopt;
  }
  const auto number = [text](std::size_t begin, std::size_t length) {
    int value = 0;
    std::from_chars(text.data() + begin, text.data() + begin + length, value);
    return value;
  };
  const CivilDate date{negative ? -number(0, tail) : number(0, tail), number(tail + 1, 2),
                       number(tail + 4, 2)};
  const int hour = number(tail + 7, 2), minute = number(tail + 10, 2),
            second = number(tail + 13, 2);
  if (date.month < 1 || date.month > 12 || hour > 23 || minute > 59 || second > 59) {
    return std::nullopt;
  }
  const std::int64_t day = daysFromCivil(date);
  if (civilFromDays(day) != date) return std::nullopt;
  const std::int64_t seconds = day * kSecondsPerDay + hour * 3600L + minute * 60L + second;
  const auto instant = static_cast<double>(seconds);
  return std::fabs(instant) <= 1e14 ? std::optional(instant) : std::nullopt;
}

}  // namespace base
