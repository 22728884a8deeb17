// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/pelloran/Arguments.h"

#include <charconv>
#include <cmath>
#include <limits>
#include <system_error>

#include "base/CivilDate.h"
#include "base/Convert.h"
#include "base/Text.h"
#include "base/Timestamp.h"
#include "base/UTF8.h"

namespace pelloran {

using base::Error;
using base::Result;

namespace {

constexpr std::size_t kMaxKeySize = 1024;

std::string quoted(std::string_view text) { return std::string("'").append(text).append("'"); }

template <typename T>
bool parsed(std::string_view text, T& value) {
  const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), value);
  return error == std::errc() && end == text.data() + text.size();
}

bool isUTF8(std::string_view text) {
  while (!text.empty()) {
    const std::size_t length = base::firstCharacter(text).length;
    if (length == 0) return false;
    text.remove_prefix(length);
  }
  return true;
}

}  // namespace

Result<void> checkKey(std::string_view key) {
  if (key.empty()) return Error{"the key is empty"};
  if (key.size() > kMaxKeySize) {
    return Error{base::format("the key has %zu bytes, more than %zu", key.size(), kMaxKeySize)};
  }
  if (key.find('\0') != std::string_view::npos) return Error{"the key holds a NUL"};
  if (!isUTF8(key)) return Error{"the key is not UTF-8"};
  return {};
}

Result<std::int32_t> parseDay(std::string_view text, std::int32_t today) {
  if (text == "today") return today;
  if (text == "yesterday") return base::dayBefore(today);
  std::int64_t day = 0;
  if (parsed(text, day)) return dayOf(day);
  const auto midnight = base::secondsFromTimestamp(std::string(text) + "T00:00:00Z");
  if (midnight && *midnight >= 0) return dayOf(base::dayNumber(*midnight));
  return Error{quoted(text) +
               " is not a day: a day number, a date as 2026-11-22, today or yesterday"};
}

Result<std::int64_t> parseInteger(std::string_view text) {
  std::int64_t value = 0;
  if (parsed(text, value)) return value;
  return Error{quoted(text) + " is not an integer of 64 bits"};
}

Result<double> parseReal(std::string_view text) {
  double value = 0;
  if (parsed(text, value) && std::isfinite(value)) return value;
  return Error{quoted(text) + " is not a finite number"};
}

Result<std::int64_t> integral(double value) {
  const double above = std::ldexp(1.0, 63);
  if (std::trunc(value) != value || value < -above || value >= above) {
    return Error{base::doubleText(value) + " is not an integer of 64 bits"};
  }
  return base::saturatingCast<std::int64_t>(value);
}

Result<std::int32_t> secondInDay(std::int64_t second) {
  if (second >= 0 && second < base::kSecondsPerDay) {
    return static_cast<std::int32_t>(second);
  }
  return Error{std::to_string(second) + " is not a second within a day, 0 to 86399"};
}

Result<std::int32_t> dayOf(std::int64_t number) {
  if (number >= 0 && number <= std::numeric_limits<std::int32_t>::max()) {
    return static_cast<std::int32_t>(number);
  }
  return Error{std::to_string(number) + " is not a day number, 0 to 2147483647"};
}

}  // namespace pelloran
