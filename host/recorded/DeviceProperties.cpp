// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/recorded/DeviceProperties.h"

#include <sys/utsname.h>
#include <systemd/sd-id128.h>

#include <array>
#include <cstdint>
#include <optional>

#include "host/files/DeviceFileSystem.h"
#include "host/files/Files.h"

namespace host::recorded {

namespace {

constexpr std::uint64_t kNoSuchContainer = 2;

// The same on every boot of this machine, and no other program's.
std::optional<std::string> identifierOfOurs() {
  constexpr sd_id128_t kApplication =
      SD_ID128_ARRAY(60, 4e, 83, 89, 41, 9e, 13, a3, 42, 9b, c1, ab, fd, 4f, b5, 62);
  sd_id128_t id;
  if (::sd_id128_get_machine_app_specific(kApplication, &id) < 0) return std::nullopt;
  std::array<char, SD_ID128_STRING_MAX> text;
  return ::sd_id128_to_string(id, text.data());
}

std::optional<std::string> machineName() {
  utsname host;
  return ::uname(&host) == 0 ? std::optional<std::string>(host.machine) : std::nullopt;
}

std::optional<std::int64_t> bytes(const plist::Dictionary& usage, const char* key) {
  const plist::Number* size = usage.number(key);
  return size != nullptr ? std::optional(size->int64Value()) : std::nullopt;
}

}  // namespace

const plist::Number* DeviceProperties::number(std::string_view name) {
  const plist::Dictionary* properties = properties_.dictionary();
  return properties != nullptr ? properties->number(name) : nullptr;
}

bool DeviceProperties::booleanProperty(std::string_view name) {
  const plist::Number* value = number(name);
  return value != nullptr && value->boolValue();
}

std::optional<std::string> DeviceProperties::textProperty(std::string_view name) {
  if (!root_.isRecorded()) {
    if (name == "SystemIdentifier") return identifierOfOurs();
    return name == "HardwareModel" ? machineName() : std::nullopt;
  }
  const plist::Dictionary* properties = properties_.dictionary();
  const std::string* text = properties != nullptr ? properties->text(name) : nullptr;
  return text != nullptr ? std::optional(*text) : std::nullopt;
}

std::optional<std::uint32_t> DeviceProperties::multiUserIndicator() {
  const plist::Number* value = number("MultiUser");
  if (value == nullptr) return std::nullopt;
  return static_cast<std::uint32_t>(value->uint64Value());
}

std::optional<platform::DeviceProperties::DiskUsage> DeviceProperties::diskUsage() {
  if (!root_.isRecorded()) {
    const auto holding = fileSystemHolding(root_, "/");
    if (!holding) return std::nullopt;
    const auto inBytes = [&](std::uint64_t blocks) {
      return static_cast<std::int64_t>(blocks * holding->blockSize);
    };
    const std::int64_t available = inBytes(holding->blocksAvailable);
    return DiskUsage{inBytes(holding->blocks), available, available};
  }
  const plist::Dictionary* properties = properties_.dictionary();
  const plist::Dictionary* usage =
      properties != nullptr ? properties->dictionary("DiskUsage") : nullptr;
  if (usage == nullptr) return std::nullopt;
  return DiskUsage{bytes(*usage, "TotalDiskCapacity"), bytes(*usage, "TotalDataAvailable"),
                   bytes(*usage, "AmountDataAvailable")};
}

DeviceProperties::GroupContainer DeviceProperties::systemGroupContainerPath(
    std::string_view identifier) {
  if (isPlainFileName(identifier, kMaxFileName)) {
    std::string path = "/var/containers/systemgroup/" + std::string(identifier);
    if (root_.openFolder(path, DeviceRoot::Missing::fails, DeviceRoot::Links::followed)) {
      return {.path = std::move(path)};
    }
  }
  return {.error = kNoSuchContainer};
}

}  // namespace host::recorded
