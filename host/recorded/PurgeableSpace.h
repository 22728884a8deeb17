// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The purgeable-space service: device/purgeable-space.plist.
#pragma once

#include "host/files/DeviceFile.h"
#include "platform/PurgeableSpace.h"

namespace host::recorded {

class PurgeableSpace : public platform::PurgeableSpace {
 public:
  PurgeableSpace(const DeviceRoot& root, platform::SystemLog& log)
      : file_(root, log, "device/purgeable-space.plist") {}

  // The file's existence is the service's presence.
  bool isPresent() override;
  std::optional<plist::Dictionary> SpacereapCopyItemizedPurgeableSpaceWithInfo(
      const plist::Dictionary& query) override;

 private:
  DeviceFile file_;
};

}  // namespace host::recorded
