// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The version of the operating system: device/system-version.plist.
#pragma once

#include "host/files/DeviceFile.h"
#include "platform/DeviceProperties.h"

namespace host::recorded {

class SystemVersion : public platform::SystemVersion {
 public:
  SystemVersion(const DeviceRoot& root, platform::SystemLog& log)
      : file_(root, log, "device/system-version.plist") {}

  std::optional<plist::Dictionary> systemVersionDictionary() override;
  std::string operatingSystemVersion() override;

 private:
  DeviceFile file_;
};

}  // namespace host::recorded
