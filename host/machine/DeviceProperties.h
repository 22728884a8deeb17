// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What this machine says of itself.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "host/files/DeviceRoot.h"
#include "platform/DeviceProperties.h"
#include "plist/Value.h"

namespace host::machine {

// Neither an internal build nor a multi-user device. System group containers are those below the
// root.
class DeviceProperties final : public platform::DeviceProperties {
 public:
  // Both are borrowed.
  DeviceProperties(const DeviceRoot& root, const DeviceRoot& files) : root_(root), files_(files) {}

  bool booleanProperty(std::string_view) override { return false; }

  // "SystemIdentifier" is an identifier of this program's own, from which nobody learns the
  // machine's, and "HardwareModel" what the firmware calls the machine, else its architecture.
  std::optional<std::string> textProperty(std::string_view name) override;

  std::optional<std::uint32_t> multiUserIndicator() override { return 0; }

  // Of the file system that holds the root.
  std::optional<DiskUsage> diskUsage() override;

  GroupContainer systemGroupContainerPath(std::string_view identifier) override;

 private:
  const DeviceRoot& root_;
  const DeviceRoot& files_;
};

// os-release.
class SystemVersion final : public platform::SystemVersion {
 public:
  explicit SystemVersion(const DeviceRoot& files) : files_(files) {}

  // The build is BUILD_ID, else VERSION_ID.
  std::optional<plist::Dictionary> systemVersionDictionary() override;
  std::string operatingSystemVersion() override;

 private:
  const DeviceRoot& files_;
};

}  // namespace host::machine
