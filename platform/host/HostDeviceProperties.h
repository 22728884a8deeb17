// Device properties and system group containers.
#pragma once

#include "platform/DeviceProperties.h"
#include "platform/host/DeviceFile.h"

namespace platform::host {

class HostDeviceProperties : public DeviceProperties {
 public:
  // `properties` is device/properties.plist, which other services read too; `machineId` is a path
  // of the host.
  HostDeviceProperties(const DeviceRoot& root, DeviceFile& properties,
                       std::string machineId = "/etc/machine-id")
      : root_(root), properties_(properties), machineId_(std::move(machineId)) {}

  bool booleanProperty(std::string_view name) override;

  // Without the entry, "SystemIdentifier" is the host's machine-id and "HardwareModel" the name of
  // its machine.
  std::optional<std::string> textProperty(std::string_view name) override;

  std::optional<std::uint32_t> multiUserIndicator() override;

  // Sizes that are negative are 0. Without the entry, the figures of the file system that holds the
  // root; with one of another type than a dictionary, no answer. A negative size counts as 0.
  std::optional<DiskUsage> diskUsage() override;

  // /var/containers/systemgroup/<identifier>, a path of the device, where that folder exists; else
  // error 2. An identifier that is not a plain name has no container.
  std::optional<std::string> systemGroupContainerPath(std::string_view identifier,
                                                      std::uint64_t& error) override;

 private:
  const Number* number(std::string_view name);

  const DeviceRoot& root_;
  DeviceFile& properties_;
  std::string machineId_;
};

}  // namespace platform::host
