// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The version of the operating system: a recorded device's
// device/system-version.plist, or this machine's os-release.
#pragma once

#include "host/files/DeviceFile.h"
#include "platform/DeviceProperties.h"

namespace host::recorded {

class SystemVersion : public platform::SystemVersion {
 public:
  // `osRelease` is a path of this machine.
  SystemVersion(const DeviceRoot& root, platform::SystemLog& log,
                std::string osRelease = "/etc/os-release")
      : root_(root),
        file_(root, log, "device/system-version.plist"),
        osRelease_(std::move(osRelease)) {}

  std::optional<plist::Dictionary> systemVersionDictionary() override;

  // "<ProductVersion> (<ProductBuildVersion>)", or the one of them that is known.
  std::string operatingSystemVersion() override;

 private:
  const DeviceRoot& root_;
  DeviceFile file_;
  std::string osRelease_;
};

}  // namespace host::recorded
