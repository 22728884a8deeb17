// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What a recorded device and this machine answer in the same way.
#pragma once

#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "host/files/DeviceRoot.h"
#include "platform/DeviceProperties.h"
#include "plist/Value.h"

namespace host {

inline constexpr char kProductVersion[] = "ProductVersion";
inline constexpr char kProductBuildVersion[] = "ProductBuildVersion";

// "<ProductVersion> (<ProductBuildVersion>)", or the one of them that is known; empty when neither
// is.
std::string versionText(const std::optional<plist::Dictionary>& version);

// /var/containers/systemgroup/<identifier>, a path of the device, where that folder exists; else
// error 2. An identifier that is not a plain name has no container.
platform::DeviceProperties::GroupContainer groupContainer(const DeviceRoot& root,
                                                          std::string_view identifier);

// For each preferred language, in order, the localization equal to it, else the longest one that
// is a prefix of it at a "-", without regard to case; each once. Without any, the first
// localization.
std::vector<std::string> bestLocalizations(const std::vector<std::string>& localizations,
                                           const std::vector<std::string>& preferred);

}  // namespace host
