// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/recorded/Locale.h"

#include <strings.h>

#include <algorithm>
#include <cstdlib>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace host::recorded {

namespace {

std::string_view environment(const char* name) {
  const char* value = std::getenv(name);
  return value != nullptr ? value : "";
}

// "de-AT" of "de_AT.UTF-8@euro"; empty for the locales that speak no language.
std::string identifier(std::string_view locale) {
  locale = locale.substr(0, locale.find_first_of(".@"));
  if (locale == "C" || locale == "POSIX") return {};
  std::string language(locale);
  std::replace(language.begin(), language.end(), '_', '-');
  return language;
}

// How far a localization serves a language: its length, or 0 when it doesn't.
std::size_t served(const std::string& localization, const std::string& language) {
  const std::size_t length = localization.size();
  if (length > language.size()) return 0;
  if (length < language.size() && language[length] != '-') return 0;
  return ::strncasecmp(localization.c_str(), language.c_str(), length) == 0 ? length : 0;
}

}  // namespace

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

std::vector<std::string> Locale::preferredLanguages() {
  if (root_.isRecorded()) return texts("PreferredLanguages");
  std::string_view list = environment("LANGUAGE");
  if (list.empty()) list = environment("LANG");
  std::vector<std::string> languages;
  while (!list.empty()) {
    const std::size_t end = std::min(list.find(':'), list.size());
    std::string language = identifier(list.substr(0, end));
    if (!language.empty()) languages.push_back(std::move(language));
    list.remove_prefix(std::min(end + 1, list.size()));
  }
  return languages;
}

std::vector<std::string> Locale::systemLocalizations() {
  return root_.isRecorded() ? texts("Localizations") : std::vector<std::string>{"en"};
}

std::optional<std::string> Locale::countryCode() {
  if (root_.isRecorded()) {
    const plist::Dictionary* locale = file_.dictionary();
    const std::string* code = locale != nullptr ? locale->text("CountryCode") : nullptr;
    return code != nullptr ? std::optional(*code) : std::nullopt;
  }
  const std::string language = identifier(environment("LANG"));
  const std::size_t territory = language.find('-');
  if (territory == language.npos || territory + 1 == language.size()) return std::nullopt;
  return language.substr(territory + 1);
}

std::vector<std::string> Locale::bestMatch(const std::vector<std::string>& localizations,
                                           const std::vector<std::string>& preferred) {
  std::vector<std::string> matches;
  for (const std::string& language : preferred) {
    const auto best = std::max_element(localizations.begin(), localizations.end(),
                                       [&](const auto& left, const auto& right) {
                                         return served(left, language) < served(right, language);
                                       });
    if (best == localizations.end() || served(*best, language) == 0) continue;
    if (std::find(matches.begin(), matches.end(), *best) == matches.end()) matches.push_back(*best);
  }
  if (matches.empty() && !localizations.empty()) matches.push_back(localizations.front());
  return matches;
}

}  // namespace host::recorded
