// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/deliver/NANDLog.h"

#include <algorithm>
#include <cmath>

#include "base/CivilDate.h"
#include "base/Text.h"

namespace NANDInfo {

namespace {

using plist::Array;
using plist::Number;
using plist::Value;

bool isNumber(const Value& value) { return value.as<Number>() != nullptr; }

std::string numberText(const Number& number) {
  const bool hasDecimals = number.isReal() && !std::isnan(number.doubleValue());
  return hasDecimals ? base::format("%.2f", number.doubleValue()) : number.text();
}

std::string joined(const Array& array) {
  std::string text;
  for (const Value& element : array) {
    if (&element != &array.front()) text += ',';
    text += plist::description(element);
  }
  return text;
}

std::optional<std::string> entryText(const Value& value) {
  if (const auto* number = value.as<Number>()) return numberText(*number);
  const auto* array = value.as<Array>();
  if (array == nullptr || std::ranges::none_of(*array, isNumber)) return std::nullopt;
  return joined(*array);
}

}  // namespace

std::string NANDLogEntries(const plist::Dictionary& values) {
  std::string entries;
  for (const auto& [key, value] : values) {
    const auto text = entryText(value);
    if (!text) continue;
    if (!entries.empty()) entries += ';';
    entries += key + ':' + *text;
  }
  return entries;
}

std::string NANDLogText(const NANDLogOrigin& origin, const std::string& entries) {
  const std::string body =
      base::format("%s %s[%d]: %s\n", origin.date.c_str(), origin.processName.c_str(),
                   origin.processIdentifier, entries.c_str());
  return base::format(
      "System ID: %s\nHardware Model: %s\nOS Version: %s\nDate: %s\nIncident ID: %s\n"
      "Faultwatch Key: %s\n\n%s",
      plist::description(origin.systemIdentifier).c_str(),
      plist::description(origin.hardwareModel).c_str(), origin.operatingSystemVersion.c_str(),
      origin.date.c_str(), origin.incidentIdentifier.c_str(), origin.faultwatchKey.c_str(),
      body.c_str());
}

std::string NANDLogDate(plist::Date instant, std::int32_t secondsFromUTC) {
  const auto t = base::civilFromSeconds(instant.secondsSince1970 + secondsFromUTC);
  const std::int32_t minutes = std::abs(secondsFromUTC / 60);
  return base::format("%04lld-%02d-%02d %02d:%02d:%02d %c%02d%02d",
                      static_cast<long long>(t.date.year), t.date.month, t.date.day, t.hour,
                      t.minute, t.second, secondsFromUTC < 0 ? '-' : '+', minutes / 60,
                      minutes % 60);
}

}  // namespace NANDInfo
