// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The device registry of this machine: its flash drives.
#pragma once

#include "host/device/RegistryTree.h"
#include "host/files/DeviceRoot.h"
#include "platform/SystemLog.h"
#include "plist/Value.h"

namespace host::machine {

// The drives, the one that holds `root` first, each an entry of class "ZMCStorage" with its
// description as property platform::kRegistryDriveKey. Its driver answers the statistics command
// with the records that the drive's figures fill, and no other. A drive without figures can be
// opened, answers nothing, and is said once. A disk that holds the root and is no such drive is an
// entry of class "Disk" without a driver. The machine's files are read at the first question.
class DriveRegistry final : public RegistryTree {
 public:
  DriveRegistry(const DeviceRoot& root, const DeviceRoot& files, platform::SystemLog& log)
      : RegistryTree(root, log), root_(root), machine_(files), log_(log) {}

 private:
  const plist::Dictionary* tree() override;

  const DeviceRoot& root_;
  const DeviceRoot& machine_;
  platform::SystemLog& log_;
  plist::Dictionary tree_;
};

}  // namespace host::machine
