// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The flash drives of this machine, as the kernel lists them, and what is known of their health.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "host/files/DeviceRoot.h"
#include "host/machine/DriveFigures.h"

namespace host::machine {

struct Drive {
  std::string name = {};  // the kernel's: nvme0, mmcblk0, sda
  const char*
      kind;  // "NVMe", "eMMC", "UFS", or "disk": one that holds the root and is none of them
  std::string model = {}, serial = {}, firmware = {};  // empty: not known
  std::uint64_t capacity = 0;                          // bytes; 0: not known
  bool holdsRoot = false;
  DriveFigures figures = {};
  std::string unknown = {};  // why there are no figures; empty when there are

  // Whether its kind has figures that make it a storage controller.
  bool isFlash = true;
};

// The mount on which a folder lies, by the kernel's number.
std::optional<std::uint64_t> mountOf(const DeviceRoot& folder);

// The drives that hold the file system of a mount come first, through partitions and mapped
// devices; then the others by their names. Drives behind a network are none of the machine's. What
// the kernel tells of a drive comes from `files`/sys, an NVMe drive's figures from its record.
std::vector<Drive> findDrives(const DeviceRoot& files, std::optional<std::uint64_t> rootMount);

}  // namespace host::machine
