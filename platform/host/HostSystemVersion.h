// The version of the operating system: device/system-version.plist, else the host's os-release.
#pragma once

#include "platform/DeviceProperties.h"
#include "platform/host/DeviceFile.h"

namespace platform::host {

class HostSystemVersion : public SystemVersion {
 public:
  // `osRelease` is a path of the host.
  HostSystemVersion(const DeviceRoot& root, PropertyListCodec& codec, SystemLog& log,
                    std::string osRelease = "/etc/os-release")
      : file_(root, codec, log, "device/system-version.plist"), osRelease_(std::move(osRelease)) {}

  std::optional<Dictionary> systemVersionDictionary() override;

  // "<ProductVersion> (<ProductBuildVersion>)", or the one of them that is known.
  std::string operatingSystemVersion() override;

 private:
  DeviceFile file_;
  std::string osRelease_;
};

}  // namespace platform::host
