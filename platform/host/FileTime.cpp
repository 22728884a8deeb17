#include "platform/host/FileTime.h"

#include <algorithm>

#include "platform/CivilDate.h"
#include "platform/Text.h"

namespace platform::host {

namespace {

CivilTime nameable(double secondsSince1970) {
  static const auto first = static_cast<double>(daysFromCivil({0, 1, 1}) * kSecondsPerDay);
  static const auto last = static_cast<double>(daysFromCivil({10000, 1, 1}) * kSecondsPerDay - 1);
  return civilFromSeconds(std::clamp(secondsSince1970, first, last));
}

}  // namespace

std::string fileTime(double secondsSince1970) {
  const CivilTime t = nameable(secondsSince1970);
  return format("%04d%02d%02dT%02d%02d%02dZ", static_cast<int>(t.date.year), t.date.month,
                t.date.day, t.hour, t.minute, t.second);
}

std::string fileDay(double secondsSince1970) {
  const CivilDate date = nameable(secondsSince1970).date;
  return format("%04d-%02d-%02d", static_cast<int>(date.year), date.month, date.day);
}

bool isFileDay(std::string_view text) {
  constexpr std::string_view kForm = "0000-00-00";
  return std::equal(text.begin(), text.end(), kForm.begin(), kForm.end(), [](char c, char form) {
    return form == '0' ? c >= '0' && c <= '9' : c == form;
  });
}

}  // namespace platform::host
