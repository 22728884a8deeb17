// Handles of the registry and its drivers that are given back when they go out of scope.
#pragma once

#include <cstdint>
#include <utility>

#include "NANDInfo/Controller.h"
#include "NANDInfo/Services.h"
#include "platform/DeviceRegistry.h"

namespace NANDInfo {

// An entry of the registry, or an iterator over it.
class RegistryHandle {
 public:
  RegistryHandle(const Services& services, platform::RegistryObject object)
      : registry_(services.registry), object_(object) {}
  RegistryHandle(const RegistryHandle&) = delete;
  RegistryHandle& operator=(const RegistryHandle&) = delete;
  ~RegistryHandle() {
    if (object_ != 0) registry_.release(object_);
  }

  platform::RegistryObject get() const { return object_; }

  // Leaves the handle to the caller.
  platform::RegistryObject detach() { return std::exchange(object_, 0); }

 private:
  platform::DeviceRegistry& registry_;
  platform::RegistryObject object_;
};

// A connection to a service, opened for the process's own task.
class DriverHandle {
 public:
  DriverHandle(const Services& services, platform::RegistryObject service)
      : drivers_(services.drivers), opened_(drivers_.DrvServiceOpen(service, 0)) {}
  DriverHandle(const DriverHandle&) = delete;
  DriverHandle& operator=(const DriverHandle&) = delete;
  ~DriverHandle() { close(); }

  // What the opening came to, and the connection: 0 is possible on success, and an open one on an
  // error.
  platform::DriverStatus status() const { return opened_.status; }
  platform::DriverConnection get() const { return opened_.connection; }

  // Leaves the connection to the caller.
  platform::DriverConnection detach() { return std::exchange(opened_.connection, 0); }

  // Closes now; a connection that isn't there closes well.
  platform::DriverStatus close() {
    const auto connection = detach();
    return connection != 0 ? drivers_.DrvServiceClose(connection) : 0;
  }

 private:
  platform::DriverConnections& drivers_;
  platform::DriverConnections::OpenResult opened_;
};

// The record of the first driver that could be opened; null when there is none.
class OpenExporter {
 public:
  explicit OpenExporter(const Services& services) : services_(services) {
    findNandExporterNew(services, exporter_);
  }
  OpenExporter(const OpenExporter&) = delete;
  OpenExporter& operator=(const OpenExporter&) = delete;
  ~OpenExporter() {
    if (exporter_ != nullptr) ReleaseIOInterfaces(services_, exporter_);
  }

  const nand_exporter_t* get() const { return exporter_; }
  const nand_exporter_t* operator->() const { return exporter_; }

 private:
  const Services services_;
  nand_exporter_t* exporter_;
};

}  // namespace NANDInfo
