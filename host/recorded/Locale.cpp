// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/recorded/Locale.h"

#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "host/device/CommonAnswers.h"

namespace host::recorded {

std::vector<std::string> Locale::texts(std::string_view key) {
  std::vector<std::string> result;
  const plist::Dictionary* locale = file_.dictionary();
  const plist::Array* array = locale != nullptr ? locale->array(key) : nullptr;
  if (array == nullptr) return result;
  for (const plist::Value& element : *array) {
    if (const auto* text = element.as<std::string>()) result.push_back(*text);
  }
  return result;
}

std::vector<std::string> Locale::preferredLanguages() { return texts("PreferredLanguages"); }

std::vector<std::string> Locale::systemLocalizations() { return texts("Localizations"); }

std::optional<std::string> Locale::countryCode() {
  const plist::Dictionary* locale = file_.dictionary();
  const std::string* code = locale != nullptr ? locale->text("CountryCode") : nullptr;
  return code != nullptr ? std::optional(*code) : std::nullopt;
}

std::vector<std::string> Locale::bestMatch(const std::vector<std::string>& localizations,
                                           const std::vector<std::string>& preferred) {
  return bestLocalizations(localizations, preferred);
}

}  // namespace host::recorded
