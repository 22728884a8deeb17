// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/machine/Device.h"

#include <memory>

#include "host/files/DeviceFileSystem.h"
#include "host/machine/Applications.h"
#include "host/machine/DeviceProperties.h"
#include "host/machine/DriveRegistry.h"
#include "host/machine/Kernel.h"
#include "host/machine/Locale.h"
#include "host/machine/NetworkUsage.h"
#include "host/machine/NoPurgeableSpace.h"
#include "host/machine/ReportingChannels.h"

namespace host::machine {

DeviceServices device(const DeviceRoot& root, const DeviceRoot& files,
                      platform::PreferenceStore& preferences, platform::SystemLog& log) {
  auto kernel = std::make_unique<Kernel>(files);
  auto snapshots = std::make_unique<KernelSnapshots>(files, *kernel);
  const auto registry = std::make_shared<DriveRegistry>(root, files, log);
  return {.properties = std::make_unique<DeviceProperties>(root, files),
          .files = std::make_unique<DeviceFileSystem>(root),
          .systemVersion = std::make_unique<SystemVersion>(files),
          .kernel = std::move(kernel),
          .snapshots = std::move(snapshots),
          .registry = registry,
          .drivers = registry,
          .purgeableSpace = std::make_unique<NoPurgeableSpace>(),
          .reportingChannels = std::make_unique<ReportingChannels>(files),
          .applications = std::make_unique<Applications>(files),
          .locale = std::make_unique<Locale>(files),
          .networkUsage = std::make_unique<NetworkUsage>(files, preferences, log)};
}

}  // namespace host::machine
