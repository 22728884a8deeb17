// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/files/FileTime.h"

#include <algorithm>

#include "base/CivilDate.h"
#include "base/Text.h"

namespace host {

namespace {

base::CivilTime nameable(double secondsSince1970) {
  static const auto first =
      static_cast<double>(base::daysFromCivil({0, 1, 1}) * base::kSecondsPerDay);
  static const auto last =
      static_cast<double>(base::daysFromCivil({10000, 1, 1}) * base::kSecondsPerDay - 1);
  return base::civilFromSeconds(std::clamp(secondsSince1970, first, last));
}

}  // namespace

std::string fileTime(double secondsSince1970) {
  const base::CivilTime t = nameable(secondsSince1970);
  return base::format("%04d%02d%02dT%02d%02d%02dZ", static_cast<int>(t.date.year), t.date.month,
                      t.date.day, t.hour, t.minute, t.second);
}

std::string fileDay(double secondsSince1970) {
  const base::CivilDate date = nameable(secondsSince1970).date;
  return base::format("%04d-%02d-%02d", static_cast<int>(date.year), date.month, date.day);
}

bool isFileDay(std::string_view text) {
  constexpr std::string_view kForm = "0000-00-00";
  return std::equal(text.begin(), text.end(), kForm.begin(), kForm.end(), [](char c, char form) {
    return form == '0' ? c >= '0' && c <= '9' : c == form;
  });
}

}  // namespace host
