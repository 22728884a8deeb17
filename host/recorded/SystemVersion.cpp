// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/recorded/SystemVersion.h"

#include <algorithm>
#include <optional>

#include <fcntl.h>

#include "host/files/Files.h"

namespace host::recorded {

namespace {

constexpr std::string_view kVersion = "ProductVersion";
constexpr std::string_view kBuild = "ProductBuildVersion";
constexpr std::size_t kMaxOsRelease = 65536;

// The value of a shell-like assignment: in quotes or bare, with backslash escapes.
std::string unquoted(std::string_view text) {
  if (text.size() >= 2 && (text.front() == '"' || text.front() == '\'') &&
      text.back() == text.front()) {
    text = text.substr(1, text.size() - 2);
  }
  std::string value;
  for (std::size_t i = 0; i < text.size(); ++i) {
    if (text[i] == '\\' && i + 1 < text.size()) ++i;
    value.push_back(text[i]);
  }
  return value;
}

// The last assignment of the name; empty when there is none.
std::string assigned(std::string_view lines, std::string_view name) {
  std::string value;
  while (!lines.empty()) {
    const std::size_t end = std::min(lines.find('\n'), lines.size());
    const std::string_view line = lines.substr(0, end);
    lines.remove_prefix(std::min(end + 1, lines.size()));
    if (line.starts_with(name) && line.substr(name.size()).starts_with('=')) {
      value = unquoted(line.substr(name.size() + 1));
    }
  }
  return value;
}

std::optional<plist::Dictionary> machineVersion(const std::string& osRelease) {
  const FileDescriptor file(::open(osRelease.c_str(), O_RDONLY | O_NONBLOCK | O_CLOEXEC));
  const auto lines = readRegularFile(file.get(), kMaxOsRelease);
  if (!lines) return std::nullopt;
  const std::string version = assigned(*lines, "VERSION_ID");
  std::string build = assigned(*lines, "BUILD_ID");
  if (build.empty()) build = version;
  plist::Dictionary dictionary;
  if (!build.empty()) dictionary.set(kBuild, plist::Value(build));
  if (!version.empty()) dictionary.set(kVersion, plist::Value(version));
  if (dictionary.empty()) return std::nullopt;
  return dictionary;
}

}  // namespace

std::optional<plist::Dictionary> SystemVersion::systemVersionDictionary() {
  if (!root_.isRecorded()) return machineVersion(osRelease_);
  const plist::Dictionary* dictionary = file_.dictionary();
  return dictionary != nullptr ? std::optional(*dictionary) : std::nullopt;
}

std::string SystemVersion::operatingSystemVersion() {
  const std::optional<plist::Dictionary> dictionary = systemVersionDictionary();
  if (!dictionary) return {};
  const std::string* version = dictionary->text(kVersion);
  const std::string* build = dictionary->text(kBuild);
  if (version != nullptr && build != nullptr) return *version + " (" + *build + ")";
  if (version != nullptr) return *version;
  return build != nullptr ? *build : std::string();
}

}  // namespace host::recorded
