// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What the device says of itself.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "plist/Value.h"

namespace platform {

class DeviceProperties {
 public:
  virtual ~DeviceProperties() = default;

  // A device property as a truth value; false when the device doesn't know it.
  virtual bool booleanProperty(std::string_view name) = 0;

  // A device property as a text; none when the device doesn't know it or it is no text.
  virtual std::optional<std::string> textProperty(std::string_view name) = 0;

  // The multi-user indicator, or none when the query fails.
  virtual std::optional<std::uint32_t> multiUserIndicator() = 0;

  // The device's disk usage in bytes; none when it has no answer, and for each figure that it
  // doesn't know.
  struct DiskUsage {
    std::optional<std::int64_t> totalDiskCapacity, totalDataAvailable, amountDataAvailable;
  };
  virtual std::optional<DiskUsage> diskUsage() = 0;

  // Where a system group container is, or the device's own code for why it is nowhere; 1 when the
  // device gave none.
  struct GroupContainer {
    std::optional<std::string> path{};
    std::uint64_t error = 1;
  };
  virtual GroupContainer systemGroupContainerPath(std::string_view identifier) = 0;
};

// The version of the operating system.
class SystemVersion {
 public:
  virtual ~SystemVersion() = default;

  // The system version dictionary ("ProductBuildVersion", "ProductVersion"), or none.
  virtual std::optional<plist::Dictionary> systemVersionDictionary() = 0;

  // The version as one text; empty when nothing is known.
  virtual std::string operatingSystemVersion() = 0;
};

}  // namespace platform
