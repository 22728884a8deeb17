// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What it takes to find the storage controller, to ask it, and to say so.
#pragma once

#include "NANDInfo/Services.h"

namespace NANDInfo {

struct ControllerServices {
  platform::SystemLog& log;
  platform::StandardStreams& streams;
  platform::DeviceRegistry& registry;
  platform::DriverConnections& drivers;
  nand_exporter_t* exporters;  // the known drivers, in their order; ended by an empty record

  ControllerServices(const Services& services)
      : log(services.log),
        streams(services.streams),
        registry(services.registry),
        drivers(services.drivers),
        exporters(services.exporters) {}
};

}  // namespace NANDInfo
