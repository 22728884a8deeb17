// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/machine/Device.h"

#include <memory>

#include "host/files/DeviceFileSystem.h"
#include "host/machine/DeviceProperties.h"
#include "host/machine/DriveRegistry.h"
#include "host/machine/Kernel.h"
#include "host/machine/Locale.h"
#include "host/machine/Nothing.h"

namespace host::machine {

DeviceServices device(const DeviceRoot& root, const DeviceRoot& files, platform::PreferenceStore&,
                      platform::SystemLog& log) {
  auto kernel = std::make_unique<Kernel>(files);
  auto snapshots = std::make_unique<KernelSnapshots>(files, *kernel);
  const auto registry = std::make_shared<DriveRegistry>(files, log);
  return {.properties = std::make_unique<DeviceProperties>(root, files),
          .files = std::make_unique<DeviceFileSystem>(root),
          .systemVersion = std::make_unique<SystemVersion>(files),
          .kernel = std::move(kernel),
          .snapshots = std::move(snapshots),
          .registry = registry,
          .drivers = registry,
          .purgeableSpace = std::make_unique<NoPurgeableSpace>(),
          .reportingChannels = std::make_unique<NoReportingChannels>(),
          .applications = std::make_unique<NoApplications>(),
          .locale = std::make_unique<Locale>(files),
          .networkUsage = std::make_unique<NoNetworkUsage>()};
}

}  // namespace host::machine
