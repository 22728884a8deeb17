// The installed applications: device/applications.plist.
#pragma once

#include "platform/InstalledApplications.h"
#include "platform/host/DeviceFile.h"

namespace platform::host {

class HostApplications : public InstalledApplications {
 public:
  HostApplications(const DeviceRoot& root, PropertyListCodec& codec, SystemLog& log)
      : file_(root, codec, log, "device/applications.plist") {}

  // Each dictionary of the array is an application. Without the file there are none.
  void enumerateBundles(const std::function<void(BundleType type)>& handler) override;

 private:
  DeviceFile file_;
};

}  // namespace platform::host
