// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What the storage library asks of the world outside, and nothing more but the drivers that it
// knows. References: whoever makes it keeps the services alive for as long.
#pragma once

#include "base/Exported.h"

namespace platform {
class Clock;
class DeviceProperties;
class DeviceRegistry;
class DriverConnections;
class Eventra;
class FaultwatchSupport;
class FileSystem;
class Kernel;
class KernelSnapshots;
class LogSubmission;
class PreferenceStore;
class PurgeableSpace;
class StandardStreams;
class SystemLog;
class SystemVersion;
}  // namespace platform

namespace MORVEND_EXPORTED NANDInfo {

struct nand_exporter_t;

// The process's table of controller drivers: nand_exporters_tunnel.
nand_exporter_t* exporterTable();

// What goes in and out by each: `log` and `streams` take messages; `clock`, `kernel`, `snapshots`,
// `deviceProperties`, `systemVersion` and `purgeableSpace` say how the device stands; `files` and
// `preferences` keep what outlives the process; `registry` and `drivers` lead to the controller;
// `submission`, `faultwatch` and `eventra` are where telemetry leaves.
struct Services {
  platform::SystemLog& log;
  platform::StandardStreams& streams;
  platform::Clock& clock;
  platform::FileSystem& files;
  platform::PreferenceStore& preferences;
  platform::LogSubmission& submission;
  platform::FaultwatchSupport& faultwatch;
  platform::Eventra& eventra;
  platform::DeviceProperties& deviceProperties;
  platform::SystemVersion& systemVersion;
  platform::Kernel& kernel;
  platform::KernelSnapshots& snapshots;
  platform::DeviceRegistry& registry;
  platform::DriverConnections& drivers;
  platform::PurgeableSpace& purgeableSpace;
  nand_exporter_t* exporters = exporterTable();  // that are looked for

  // Each service under its name, out of whatever has them: a host, a test's fakes.
  template <typename Source>
  Services(const Source& source)
      : log(source.log),
        streams(source.streams),
        clock(source.clock),
        files(source.files),
        preferences(source.preferences),
        submission(source.submission),
        faultwatch(source.faultwatch),
        eventra(source.eventra),
        deviceProperties(source.deviceProperties),
        systemVersion(source.systemVersion),
        kernel(source.kernel),
        snapshots(source.snapshots),
        registry(source.registry),
        drivers(source.drivers),
        purgeableSpace(source.purgeableSpace) {}
};

}  // namespace NANDInfo
