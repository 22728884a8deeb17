// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/device/CommonAnswers.h"

#include <strings.h>

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "host/files/Files.h"

namespace host {

namespace {

constexpr std::uint64_t kNoSuchContainer = 2;

// How far a localization serves a language: its length, or 0 when it doesn't.
std::size_t served(const std::string& localization, const std::string& language) {
  const std::size_t length = localization.size();
  if (length > language.size()) return 0;
  if (length < language.size() && language[length] != '-') return 0;
  return ::strncasecmp(localization.c_str(), language.c_str(), length) == 0 ? length : 0;
}

}  // namespace

std::string versionText(const std::optional<plist::Dictionary>& dictionary) {
  if (!dictionary) return {};
  const std::string* version = dictionary->text(kProductVersion);
  const std::string* build = dictionary->text(kProductBuildVersion);
  if (version != nullptr && build != nullptr) return *version + " (" + *build + ")";
  if (version != nullptr) return *version;
  return build != nullptr ? *build : std::string();
}

platform::DeviceProperties::GroupContainer groupContainer(const DeviceRoot& root,
                                                          std::string_view identifier) {
  if (isPlainFileName(identifier, kMaxFileName)) {
    std::string path = "/var/containers/systemgroup/" + std::string(identifier);
    if (root.openFolder(path, DeviceRoot::Missing::fails, DeviceRoot::Links::followed)) {
      return {.path = std::move(path)};
    }
  }
  return {.error = kNoSuchContainer};
}

std::vector<std::string> bestLocalizations(const std::vector<std::string>& localizations,
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

}  // namespace host
