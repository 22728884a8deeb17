// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The device registry of this machine: its flash drives.
#pragma once

#include "host/device/RegistryTree.h"
#include "host/files/DeviceRoot.h"
#include "platform/SystemLog.h"
#include "plist/Value.h"

namespace host::machine {

// There is no registry.
class DriveRegistry final : public RegistryTree {
 public:
  DriveRegistry(const DeviceRoot& files, platform::SystemLog& log) : RegistryTree(files, log) {}

 private:
  const plist::Dictionary* tree() override { return nullptr; }
};

}  // namespace host::machine
