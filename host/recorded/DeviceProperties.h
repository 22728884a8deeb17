// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Device properties, device/properties.plist, and system group containers.
#pragma once

#include "host/files/DeviceFile.h"
#include "platform/DeviceProperties.h"
#include "platform/FileSystem.h"

namespace host::recorded {

class DeviceProperties : public platform::DeviceProperties {
 public:
  DeviceProperties(const DeviceRoot& root, platform::SystemLog& log)
      : root_(root), properties_(root, log, "device/properties.plist") {}

  bool booleanProperty(std::string_view name) override;
  std::optional<std::string> textProperty(std::string_view name) override;
  std::optional<std::uint32_t> multiUserIndicator() override;

  // No answer when the entry has another type than a dictionary.
  std::optional<DiskUsage> diskUsage() override;

  GroupContainer systemGroupContainerPath(std::string_view identifier) override;

  // What the properties hold under "FileSystem"; none with a figure that is no number, or negative.
  std::optional<platform::FileSystem::Statistics> fileSystem();

 private:
  const plist::Number* number(std::string_view name);

  const DeviceRoot& root_;
  DeviceFile properties_;
};

}  // namespace host::recorded
