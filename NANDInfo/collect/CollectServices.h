// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What the collectors ask: the controller, and the rest of the device.
#pragma once

#include "NANDInfo/controller/ControllerServices.h"

namespace NANDInfo {

struct CollectServices {
  ControllerServices controller;
  platform::FileSystem& files;
  platform::PreferenceStore& preferences;
  platform::DeviceProperties& deviceProperties;
  platform::KernelSnapshots& snapshots;
  platform::PurgeableSpace& purgeableSpace;

  CollectServices(const Services& services)
      : controller(services),
        files(services.files),
        preferences(services.preferences),
        deviceProperties(services.deviceProperties),
        snapshots(services.snapshots),
        purgeableSpace(services.purgeableSpace) {}
};

}  // namespace NANDInfo
