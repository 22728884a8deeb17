// The version of the operating system: a recorded device's
// device/system-version.plist, or this machine's os-release.
#pragma once

#include "platform/DeviceProperties.h"
#include "platform/host/DeviceFile.h"

namespace platform::host {

class HostSystemVersion : public SystemVersion {
 public:
  // `osRelease` is a path of this machine.
  HostSystemVersion(const DeviceRoot& root, PropertyListCodec& codec, SystemLog& log,
                    std::string osRelease = "/etc/os-release")
      : root_(root),
        file_(root, codec, log, "device/system-version.plist"),
        osRelease_(std::move(osRelease)) {}

  std::optional<Dictionary> systemVersionDictionary() override;

  // "<ProductVersion> (<ProductBuildVersion>)", or the one of them that is known.
  std::string operatingSystemVersion() override;

 private:
  const DeviceRoot& root_;
  DeviceFile file_;
  std::string osRelease_;
};

}  // namespace platform::host
