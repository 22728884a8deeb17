// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The user's languages and region: a recorded device's device/locale.plist, or LANGUAGE and LANG of
// this machine's environment.
#pragma once

#include <string_view>

#include "host/files/DeviceFile.h"
#include "platform/LocaleService.h"

namespace host::recorded {

class Locale : public platform::LocaleService {
 public:
  Locale(const DeviceRoot& root, platform::SystemLog& log)
      : root_(root), file_(root, log, "device/locale.plist") {}

  // What a recorded device's file doesn't hold is not known: empty, or none. This machine's
  // localization is "en"; "C" and "POSIX" are no languages.
  std::vector<std::string> preferredLanguages() override;
  std::vector<std::string> systemLocalizations() override;
  std::optional<std::string> countryCode() override;

  // For each preferred language, in order, the localization equal to it, else the longest one that
  // is a prefix of it at a "-", without regard to case; each once. Without any, the first
  // localization.
  std::vector<std::string> bestMatch(const std::vector<std::string>& localizations,
                                     const std::vector<std::string>& preferred) override;

 private:
  std::vector<std::string> texts(std::string_view key);

  const DeviceRoot& root_;
  DeviceFile file_;
};

}  // namespace host::recorded
