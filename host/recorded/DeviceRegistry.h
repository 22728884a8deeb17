// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The recorded device's registry: device/registry.plist, which is read at the first question.
// Without the file, or with anything but a dictionary at its top, there is no registry.
#pragma once

#include "host/device/RegistryTree.h"
#include "host/files/DeviceFile.h"

namespace host::recorded {

class DeviceRegistry final : public RegistryTree {
 public:
  DeviceRegistry(const DeviceRoot& root, platform::SystemLog& log)
      : RegistryTree(root, log), file_(root, log, "device/registry.plist") {}

 private:
  const plist::Dictionary* tree() override { return file_.dictionary(); }

  DeviceFile file_;
};

}  // namespace host::recorded
