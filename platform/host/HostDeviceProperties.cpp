#include "platform/host/HostDeviceProperties.h"

namespace platform::host {

namespace {

constexpr std::uint64_t kNoSuchContainer = 2;

bool isPlainName(std::string_view name) {
  return !name.empty() && name != "." && name != ".." &&
         name.find_first_of(std::string_view("/\0", 2)) == name.npos;
}

}  // namespace

const Number* HostDeviceProperties::number(std::string_view name) {
  const Dictionary* properties = properties_.dictionary();
  return properties != nullptr ? properties->number(name) : nullptr;
}

bool HostDeviceProperties::booleanProperty(std::string_view name) {
  const Number* value = number(name);
  return value != nullptr && value->boolValue();
}

std::optional<std::uint32_t> HostDeviceProperties::multiUserIndicator() {
  const Number* value = number("MultiUser");
  if (value == nullptr) return std::nullopt;
  return static_cast<std::uint32_t>(value->uint64Value());
}

std::optional<DeviceProperties::DiskUsage> HostDeviceProperties::diskUsage() {
  return std::nullopt;
}

std::optional<std::string> HostDeviceProperties::systemGroupContainerPath(
    std::string_view identifier, std::uint64_t& error) {
  if (isPlainName(identifier)) {
    std::string path = "/var/containers/systemgroup/" + std::string(identifier);
    if (root_.openFolder(path, DeviceRoot::Missing::fails, DeviceRoot::Links::followed)) {
      return path;
    }
  }
  error = kNoSuchContainer;
  return std::nullopt;
}

}  // namespace platform::host
