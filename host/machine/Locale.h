// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The languages and the region of this machine: /etc/locale.conf or /etc/default/locale, overridden
// by the environment's LANGUAGE and LANG.
#pragma once

#include <optional>
#include <string>
#include <vector>

#include "host/files/DeviceRoot.h"
#include "platform/LocaleService.h"

namespace host::machine {

class Locale final : public platform::LocaleService {
 public:
  explicit Locale(const DeviceRoot& files) : files_(files) {}

  // LANGUAGE, else LANG; "C" and "POSIX" are no languages.
  std::vector<std::string> preferredLanguages() override;

  // "en", which all texts of this system are.
  std::vector<std::string> systemLocalizations() override { return {"en"}; }

  // That of LANG.
  std::optional<std::string> countryCode() override;

  std::vector<std::string> bestMatch(const std::vector<std::string>& localizations,
                                     const std::vector<std::string>& preferred) override;

 private:
  std::string setting(const char* name);

  const DeviceRoot& files_;
};

}  // namespace host::machine
