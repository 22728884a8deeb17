// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The user's languages and region: device/locale.plist.
#pragma once

#include <string_view>

#include "host/files/DeviceFile.h"
#include "platform/LocaleService.h"

namespace host::recorded {

class Locale : public platform::LocaleService {
 public:
  Locale(const DeviceRoot& root, platform::SystemLog& log)
      : file_(root, log, "device/locale.plist") {}

  // What the file doesn't hold is not known: empty, or none.
  std::vector<std::string> preferredLanguages() override;
  std::vector<std::string> systemLocalizations() override;
  std::optional<std::string> countryCode() override;

  std::vector<std::string> bestMatch(const std::vector<std::string>& localizations,
                                     const std::vector<std::string>& preferred) override;

 private:
  std::vector<std::string> texts(std::string_view key);

  DeviceFile file_;
};

}  // namespace host::recorded
