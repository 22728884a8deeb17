// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/machine/DeviceProperties.h"

#include <sys/utsname.h>
#include <systemd/sd-id128.h>

#include <array>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "host/device/CommonAnswers.h"
#include "host/files/DeviceFileSystem.h"
#include "host/machine/SourceFiles.h"

namespace host::machine {

namespace {

// The same on every boot of this machine, and no other program's.
std::optional<std::string> identifierOfOurs() {
  constexpr sd_id128_t kApplication =
      SD_ID128_ARRAY(60, 4e, 83, 89, 41, 9e, 13, a3, 42, 9b, c1, ab, fd, 4f, b5, 62);
  sd_id128_t id;
  if (::sd_id128_get_machine_app_specific(kApplication, &id) < 0) return std::nullopt;
  std::array<char, SD_ID128_STRING_MAX> text;
  return ::sd_id128_to_string(id, text.data());
}

std::optional<std::string> architecture() {
  utsname host;
  return ::uname(&host) == 0 ? std::optional<std::string>(host.machine) : std::nullopt;
}

std::optional<std::string> hardwareModel(const DeviceRoot& files) {
  for (const char* path : {"/sys/class/dmi/id/product_name", "/proc/device-tree/model"}) {
    if (auto model = sourceLine(files, path)) return model;
  }
  return architecture();
}

}  // namespace

std::optional<std::string> DeviceProperties::textProperty(std::string_view name) {
  if (name == "SystemIdentifier") return identifierOfOurs();
  return name == "HardwareModel" ? hardwareModel(files_) : std::nullopt;
}

std::optional<platform::DeviceProperties::DiskUsage> DeviceProperties::diskUsage() {
  const auto holding = fileSystemHolding(root_, "/");
  if (!holding) return std::nullopt;
  const auto inBytes = [&](std::uint64_t blocks) {
    return static_cast<std::int64_t>(blocks * holding->blockSize);
  };
  const std::int64_t available = inBytes(holding->blocksAvailable);
  return DiskUsage{inBytes(holding->blocks), available, available};
}

DeviceProperties::GroupContainer DeviceProperties::systemGroupContainerPath(
    std::string_view identifier) {
  return groupContainer(root_, identifier);
}

std::optional<plist::Dictionary> SystemVersion::systemVersionDictionary() {
  auto lines = sourceText(files_, "/etc/os-release");
  if (!lines) lines = sourceText(files_, "/usr/lib/os-release");
  if (!lines) return std::nullopt;
  const std::string version = assignedValue(*lines, "VERSION_ID");
  std::string build = assignedValue(*lines, "BUILD_ID");
  if (build.empty()) build = version;
  plist::Dictionary dictionary;
  if (!build.empty()) dictionary.set(kProductBuildVersion, plist::Value(build));
  if (!version.empty()) dictionary.set(kProductVersion, plist::Value(version));
  if (dictionary.empty()) return std::nullopt;
  return dictionary;
}

std::string SystemVersion::operatingSystemVersion() {
  return versionText(systemVersionDictionary());
}

}  // namespace host::machine
