// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/collect/NVRAMInfo.h"

#include <utility>

#include "platform/DeviceRegistry.h"

namespace NANDInfo {

using plist::Dictionary;

Dictionary nvramInfo(const DriverAccess& access) {
  static constexpr struct {
    const char *property, *field;
  } kProperties[] = {{"CommonUsed", "commonused"},
                     {"SystemUsed", "systemused"},
                     {"Generation", "norwrites"},
                     {"Version", "version"}};
  const auto service = DriverService::matching(access, "NvramDiagService");
  if (!service.isPresent()) return {};
  Dictionary statistics;
  for (const auto& [property, field] : kProperties) {
    auto value = service.property(property, platform::DeviceRegistry::Direction::children);
    if (value) statistics.set(field, *std::move(value));
  }
  return statistics;
}

}  // namespace NANDInfo
