// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Device properties and system group containers.
#pragma once

#include "host/files/DeviceFile.h"
#include "platform/DeviceProperties.h"

namespace host::recorded {

class DeviceProperties : public platform::DeviceProperties {
 public:
  // `properties` is device/properties.plist, which other services read too.
  DeviceProperties(const DeviceRoot& root, DeviceFile& properties)
      : root_(root), properties_(properties) {}

  bool booleanProperty(std::string_view name) override;

  // A recorded device has what its properties hold. This machine has a "SystemIdentifier" of this
  // program's own, from which nobody learns the machine's, and a "HardwareModel".
  std::optional<std::string> textProperty(std::string_view name) override;

  std::optional<std::uint32_t> multiUserIndicator() override;

  // A recorded device's entry, which is no answer when it has another type than a dictionary; this
  // machine's file system that holds the root.
  std::optional<DiskUsage> diskUsage() override;

  // /var/containers/systemgroup/<identifier>, a path of the device, where that folder exists; else
  // error 2. An identifier that is not a plain name has no container.
  GroupContainer systemGroupContainerPath(std::string_view identifier) override;

 private:
  const plist::Number* number(std::string_view name);

  const DeviceRoot& root_;
  DeviceFile& properties_;
};

}  // namespace host::recorded
