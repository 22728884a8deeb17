// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/recorded/SystemVersion.h"

#include <optional>
#include <string>

#include "host/device/CommonAnswers.h"

namespace host::recorded {

std::optional<plist::Dictionary> SystemVersion::systemVersionDictionary() {
  const plist::Dictionary* dictionary = file_.dictionary();
  return dictionary != nullptr ? std::optional(*dictionary) : std::nullopt;
}

std::string SystemVersion::operatingSystemVersion() {
  return versionText(systemVersionDictionary());
}

}  // namespace host::recorded
