// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What answers for a device beside its files. There are two makers, recorded/Device.h and
// machine/Device.h; who uses the services can't tell which of them made them.
#pragma once

#include <memory>

#include "platform/DeviceProperties.h"
#include "platform/DeviceRegistry.h"
#include "platform/FileSystem.h"
#include "platform/InstalledApplications.h"
#include "platform/Kernel.h"
#include "platform/KernelSnapshots.h"
#include "platform/LocaleService.h"
#include "platform/NetworkUsage.h"
#include "platform/PurgeableSpace.h"
#include "platform/ReportingChannels.h"

namespace host {

// None is null. A service may use those before it.
struct DeviceServices {
  std::unique_ptr<platform::DeviceProperties> properties;
  std::unique_ptr<platform::FileSystem> files;
  std::unique_ptr<platform::SystemVersion> systemVersion;
  std::unique_ptr<platform::Kernel> kernel;
  std::unique_ptr<platform::KernelSnapshots> snapshots;
  std::shared_ptr<platform::DeviceRegistry> registry;  // one object is this and the drivers
  std::shared_ptr<platform::DriverConnections> drivers;
  std::unique_ptr<platform::PurgeableSpace> purgeableSpace;
  std::unique_ptr<platform::ReportingChannels> reportingChannels;
  std::unique_ptr<platform::InstalledApplications> applications;
  std::unique_ptr<platform::LocaleService> locale;
  std::unique_ptr<platform::NetworkUsage> networkUsage;  // goes before what its replies use
};

}  // namespace host
