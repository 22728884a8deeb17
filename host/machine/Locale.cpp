// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/machine/Locale.h"

#include <algorithm>
#include <cstddef>
#include <cstdlib>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "host/device/CommonAnswers.h"
#include "host/machine/SourceFiles.h"

namespace host::machine {

namespace {

constexpr std::size_t kMaxLanguages = 64;
constexpr std::size_t kMaxLanguage = 64;  // bytes

// "de-AT" of "de_AT.UTF-8@euro"; empty for the locales that speak no language.
std::string identifier(std::string_view locale) {
  locale = locale.substr(0, locale.find_first_of(".@"));
  if (locale == "C" || locale == "POSIX" || locale.size() > kMaxLanguage) return {};
  std::string language(locale);
  std::ranges::replace(language, '_', '-');
  return language;
}

}  // namespace

std::string Locale::setting(const char* name) {
  if (const char* value = std::getenv(name); value != nullptr && *value != '\0') return value;
  for (const char* path : {"/etc/locale.conf", "/etc/default/locale"}) {
    if (const auto lines = sourceText(files_, path)) return assignedValue(*lines, name);
  }
  return {};
}

std::vector<std::string> Locale::preferredLanguages() {
  std::string list = setting("LANGUAGE");
  if (list.empty()) list = setting("LANG");
  std::vector<std::string> languages;
  for (std::string_view rest = list; !rest.empty() && languages.size() < kMaxLanguages;) {
    std::string language = identifier(takeUntil(rest, ':'));
    if (!language.empty()) languages.push_back(std::move(language));
  }
  return languages;
}

std::optional<std::string> Locale::countryCode() {
  const std::string language = identifier(setting("LANG"));
  const std::size_t territory = language.find('-');
  if (territory == language.npos || territory + 1 == language.size()) return std::nullopt;
  return language.substr(territory + 1);
}

std::vector<std::string> Locale::bestMatch(const std::vector<std::string>& localizations,
                                           const std::vector<std::string>& preferred) {
  return bestLocalizations(localizations, preferred);
}

}  // namespace host::machine
