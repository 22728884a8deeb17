#include "NANDInfo/Controller.h"

#include <array>
#include <utility>

#include "NANDInfo/NANDInfo.h"
#include "NANDInfo/Services.h"
#include "NANDInfo/controller/DriverHandles.h"
#include "base/ByteReader.h"
#include "base/Text.h"
#include "platform/DeviceRegistry.h"
#include "platform/StandardStreams.h"
#include "platform/SystemLog.h"

namespace NANDInfo {

using platform::LogLevel;

namespace {

constexpr char kNoConnection[] = "Could not get connection to service\n";
constexpr char kNotClosed[] = "Could not close connection to service\n";

}  // namespace

platform::RegistryObject FindServiceUsingIterator(const Services& services, const char* className) {
  const RegistryHandle root(services, services.registry.rootEntry());
  if (root.get() == 0) return 0;
  const RegistryHandle iterator(services, services.registry.createIterator());
  if (iterator.get() == 0) return 0;
  while (const auto object = services.registry.next(iterator.get())) {
    RegistryHandle entry(services, object);
    if (services.registry.conformsTo(entry.get(), className)) return entry.detach();
  }
  return 0;
}

platform::RegistryObject findNandExporter(const Services& services, nand_exporter_t*& exporter) {
  for (exporter = nand_exporters_tunnel; exporter->className != nullptr; ++exporter) {
    if (const auto service = services.registry.DrvGetMatchingService(exporter->className)) {
      services.log.log(LogLevel::standard, "NANDInfo: findNandExporter: Controller found: %s\n",
                       exporter->className);
      return service;
    }
  }
  services.streams.writeError(
      "Failed to find matching service with DrvGetMatchingService, trying iterator...\n");
  for (exporter = nand_exporters_tunnel; exporter->className != nullptr; ++exporter) {
    if (const auto service = FindServiceUsingIterator(services, exporter->className)) {
      services.log.log(LogLevel::standard, "Find service for class %s\n", exporter->className);
      return service;
    }
  }
  return 0;
}

bool findNandExporterNew(const Services& services, nand_exporter_t*& exporter) {
  exporter = nullptr;
  for (auto* row = nand_exporters_tunnel; row->className != nullptr; ++row) {
    RegistryHandle service(services, services.registry.DrvGetMatchingService(row->className));
    if (service.get() == 0) continue;
    DriverHandle connection(services, service.get());
    if (connection.status() != 0) continue;
    services.log.log(LogLevel::standard, "NANDInfo: findNandExporterNew: Controller found: %s\n",
                     row->className);
    row->io_connection = connection.detach();
    row->service = service.detach();
    exporter = row;
    return true;
  }
  return false;
}

void ReleaseIOInterfaces(const Services& services, nand_exporter_t* exporter) {
  if (const auto connection = std::exchange(exporter->io_connection, 0)) {
    services.drivers.DrvServiceClose(connection);
  }
  if (const auto service = std::exchange(exporter->service, 0)) services.registry.release(service);
}

bool load_nand_info(const Services& services, nand_exporter_t*& exporter,
                    LegacyNandInfoCxt* context) {
  const RegistryHandle service(services, findNandExporter(services, exporter));
  if (service.get() == 0) {
    services.streams.writeError("Could not get matching Regmora service for exporting classes\n");
    return false;
  }
  DriverHandle connection(services, service.get());
  if (connection.status() != 0) {
    services.streams.writeError(kNoConnection);
    return false;
  }
  TunnelCommandBlock block;
  Buffer buffer;
  bool loaded = executeTunnelCommand(services, connection.get(), exporter,
                                     exporter->getStatsSelectors(), block, buffer) &&
                exporter->parseLegacy != nullptr && exporter->parseLegacy(context, buffer);
  if (connection.close() != 0) {
    services.streams.writeError(kNotClosed);
    loaded = false;
  }
  return loaded;
}

bool openZMCConnection(const Services& services, zmc_connection_t& connection) {
  connection.connection = 0;
  connection.service = findNandExporter(services, connection.exporter);
  if (connection.service == 0) {
    services.streams.writeError("Can't get ZMC Connection, no matching service!\n");
    closeZMCConnection(services, connection);
    return false;
  }
  nand_exporter_t& exporter = *connection.exporter;
  const auto opened = services.drivers.DrvServiceOpen(connection.service, 0);
  connection.connection = exporter.io_connection = opened.connection;
  if (opened.status != 0) {
    services.streams.writeError(base::format("DrvServiceOpen failed for class '%s', result 0x%x\n",
                                             exporter.className, opened.status));
  }
  const bool hasStats =
      exporter.getStatsSelectors != nullptr && exporter.getStatsSelectors() == getStatsSelectors();
  if (connection.connection == 0 || !hasStats) {
    services.streams.writeError("Can't get ZMC Connection!\n");
    closeZMCConnection(services, connection);
    return false;
  }
  return true;
}

void closeZMCConnection(const Services& services, zmc_connection_t& connection) {
  if (const auto open = std::exchange(connection.connection, 0)) {
    services.drivers.DrvServiceClose(open);
    // The record shall not keep a handle that is gone; one that it got since is not ours.
    if (connection.exporter != nullptr && connection.exporter->io_connection == open) {
      connection.exporter->io_connection = 0;
    }
  }
  if (const auto service = std::exchange(connection.service, 0)) services.registry.release(service);
}

plist::Value NandRecommendsContentDeletion(const Services& services) {
  nand_exporter_t* exporter;
  const RegistryHandle service(services, findNandExporter(services, exporter));
  if (exporter->recommendDeletionSelector == kNoSelector) return false;
  if (service.get() == 0) {
    services.streams.writeError(
        "_load_nand_infoCould not get matching Regmora service for exporting classes\n");
    return false;
  }
  DriverHandle connection(services, service.get());
  if (connection.status() != 0) {
    services.streams.writeError(kNoConnection);
    return false;
  }
  std::array<std::byte, 4> output{};
  const auto answer = services.drivers.DrvCallStructMethod(
      connection.get(), exporter->recommendDeletionSelector, {}, output);
  if (connection.close() != 0) services.streams.writeError(kNotClosed);
  return answer.status == 0 && answer.outputSize > 3 &&
         base::littleEndian<std::uint32_t>(output) != 0;
}

}  // namespace NANDInfo
