// The purgeable-space service: device/purgeable-space.plist.
#pragma once

#include "platform/PurgeableSpace.h"
#include "platform/host/DeviceFile.h"

namespace platform::host {

class HostPurgeableSpace : public PurgeableSpace {
 public:
  HostPurgeableSpace(const DeviceRoot& root, PropertyListCodec& codec, SystemLog& log)
      : file_(root, codec, log, "device/purgeable-space.plist") {}

  // The file's existence is the service's presence.
  bool isPresent() override;
  std::optional<Dictionary> SpacereapCopyItemizedPurgeableSpaceWithInfo(
      const Dictionary& query) override;

 private:
  DeviceFile file_;
};

}  // namespace platform::host
