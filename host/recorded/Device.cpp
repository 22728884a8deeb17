// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/recorded/Device.h"

#include <memory>

#include "host/recorded/Applications.h"
#include "host/recorded/DeviceProperties.h"
#include "host/recorded/DeviceRegistry.h"
#include "host/recorded/FileSystem.h"
#include "host/recorded/Kernel.h"
#include "host/recorded/KernelSnapshots.h"
#include "host/recorded/Locale.h"
#include "host/recorded/NetworkUsage.h"
#include "host/recorded/PurgeableSpace.h"
#include "host/recorded/ReportingChannels.h"
#include "host/recorded/SystemVersion.h"

namespace host::recorded {

DeviceServices device(const DeviceRoot& root, platform::SystemLog& log, EccEventFiles& eccEvents) {
  auto properties = std::make_unique<DeviceProperties>(root, log);
  auto files = std::make_unique<FileSystem>(root, *properties);
  const auto registry = std::make_shared<DeviceRegistry>(root, log);
  return {.properties = std::move(properties),
          .files = std::move(files),
          .systemVersion = std::make_unique<SystemVersion>(root, log),
          .kernel = std::make_unique<Kernel>(root, log, eccEvents),
          .snapshots = std::make_unique<KernelSnapshots>(root),
          .registry = registry,
          .drivers = registry,
          .purgeableSpace = std::make_unique<PurgeableSpace>(root, log),
          .reportingChannels = std::make_unique<ReportingChannels>(root, log),
          .applications = std::make_unique<Applications>(root, log),
          .locale = std::make_unique<Locale>(root, log),
          .networkUsage = std::make_unique<NetworkUsage>(root, log)};
}

}  // namespace host::recorded
