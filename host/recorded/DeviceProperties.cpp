// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/recorded/DeviceProperties.h"

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "host/device/CommonAnswers.h"

namespace host::recorded {

namespace {

std::optional<std::int64_t> bytes(const plist::Dictionary& usage, const char* key) {
  const plist::Number* size = usage.number(key);
  return size != nullptr ? std::optional(size->int64Value()) : std::nullopt;
}

std::optional<std::uint64_t> amount(const plist::Dictionary& figures, const char* key) {
  const plist::Number* number = figures.number(key);
  if (number == nullptr || number->int64Value() < 0) return std::nullopt;
  return number->uint64Value();
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
  const plist::Dictionary* properties = properties_.dictionary();
  const plist::Dictionary* usage =
      properties != nullptr ? properties->dictionary("DiskUsage") : nullptr;
  if (usage == nullptr) return std::nullopt;
  return DiskUsage{bytes(*usage, "TotalDiskCapacity"), bytes(*usage, "TotalDataAvailable"),
                   bytes(*usage, "AmountDataAvailable")};
}

std::optional<platform::FileSystem::Statistics> DeviceProperties::fileSystem() {
  const plist::Dictionary* properties = properties_.dictionary();
  const plist::Dictionary* recorded =
      properties != nullptr ? properties->dictionary("FileSystem") : nullptr;
  if (recorded == nullptr) return std::nullopt;
  const auto blockSize = amount(*recorded, "BlockSize"), blocks = amount(*recorded, "Blocks"),
             available = amount(*recorded, "BlocksAvailable");
  if (!blockSize || !blocks || !available) return std::nullopt;
  return platform::FileSystem::Statistics{*blockSize, *blocks, *available};
}

DeviceProperties::GroupContainer DeviceProperties::systemGroupContainerPath(
    std::string_view identifier) {
  return groupContainer(root_, identifier);
}

}  // namespace host::recorded
