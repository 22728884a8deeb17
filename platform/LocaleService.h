// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The user's languages and region.
#pragma once

#include <optional>
#include <string>
#include <vector>

namespace platform {

class LocaleService {
 public:
  virtual ~LocaleService() = default;

  // Language identifiers, best first.
  virtual std::vector<std::string> preferredLanguages() = 0;
  virtual std::vector<std::string> systemLocalizations() = 0;

  // Those of the localizations that serve the preferred languages best, best first.
  virtual std::vector<std::string> bestMatch(const std::vector<std::string>& localizations,
                                             const std::vector<std::string>& preferred) = 0;

  // The country code of the current locale, or none when there is no locale or it has no country.
  virtual std::optional<std::string> countryCode() = 0;
};

}  // namespace platform
