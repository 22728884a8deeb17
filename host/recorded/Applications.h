// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The installed applications: device/applications.plist.
#pragma once

#include "host/files/DeviceFile.h"
#include "platform/InstalledApplications.h"

namespace host::recorded {

class Applications : public platform::InstalledApplications {
 public:
  Applications(const DeviceRoot& root, platform::SystemLog& log)
      : file_(root, log, "device/applications.plist") {}

  // Each dictionary of the array is an application. Without the file there are none.
  void enumerateBundles(const std::function<void(BundleType type)>& handler) override;

 private:
  DeviceFile file_;
};

}  // namespace host::recorded
