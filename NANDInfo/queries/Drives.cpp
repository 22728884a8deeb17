// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/queries/Drives.h"

#include "platform/DeviceRegistry.h"

namespace NANDInfo {

plist::Array describedDrives(platform::DeviceRegistry& registry) {
  plist::Array drives;
  const platform::RegistryObject iterator = registry.createIterator();
  while (const platform::RegistryObject entry = iterator != 0 ? registry.next(iterator) : 0) {
    if (registry.conformsTo(entry, "ZMCStorage") || registry.conformsTo(entry, "Disk")) {
      auto drive = registry.searchProperty(entry, platform::kRegistryDriveKey,
                                           platform::DeviceRegistry::Direction::children);
      if (drive && drive->as<plist::Dictionary>() != nullptr) drives.push_back(*std::move(drive));
    }
    registry.release(entry);
  }
  if (iterator != 0) registry.release(iterator);
  return drives;
}

}  // namespace NANDInfo
