// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/Controller.h"

#include <utility>

#include "NANDInfo/APIErrorMessage.h"
#include "NANDInfo/EAN.h"
#include "NANDInfo/NANDInfo.h"
#include "NANDInfo/controller/EANService.h"
#include "NANDInfo/controller/StorageController.h"
#include "base/Text.h"
#include "platform/StandardStreams.h"

namespace NANDInfo {

platform::RegistryObject FindServiceUsingIterator(const Services& services, const char* className) {
  return DriverService::walkedTo(services, className).release().service;
}

platform::RegistryObject findNandExporter(const Services& services, nand_exporter_t*& exporter) {
  StorageController controller = findController(services);
  exporter = controller.exporter;
  return controller.service.release().service;
}

bool findNandExporterNew(const Services& services, nand_exporter_t*& exporter) {
  auto controller = openController(services);
  exporter = controller ? controller->exporter : nullptr;
  if (!controller) return false;
  const auto handles = controller->service.release();
  exporter->io_connection = handles.connection;
  exporter->service = handles.service;
  return true;
}

void ReleaseIOInterfaces(const Services& services, nand_exporter_t* exporter) {
  const DriverService returned(services, {.service = std::exchange(exporter->service, 0),
                                          .connection = std::exchange(exporter->io_connection, 0)});
}

bool executeTunnelCommand(const Services& services, platform::DriverConnection connection,
                          const nand_exporter_t* exporter, const SelectorPair* selectors,
                          TunnelCommandBlock& block, Buffer& buffer) {
  block.inLength = 0;
  block.inBuffer = 0;
  DriverService service(services, {.connection = connection});
  const char* problem = obstacle(service, exporter, selectors);
  if (problem == nullptr) {
    block.inLength = static_cast<std::uint32_t>(buffer.size());
    block.inBuffer = reinterpret_cast<std::uintptr_t>(&buffer);
    const TunnelAnswer answer = service.exchange({.sizeMethod = exporter->sizeSelector,
                                                  .dataMethod = exporter->dataSelector,
                                                  .opTypes = *selectors,
                                                  .argument = block.argument,
                                                  .inLength = block.inLength,
                                                  .inBuffer = block.inBuffer});
    const bool fetches = answer.failure == TunnelAnswer::Failure::none ||
                         answer.failure == TunnelAnswer::Failure::data;
    block.opType = fetches ? selectors->dataOpType : selectors->sizeOpType;
    block.sizeQuery = fetches ? 0 : 1;
    problem = failureText(answer.failure);
    if (answer.failure == TunnelAnswer::Failure::size) buffer.clear();
    const auto bytes = answer.delivered();
    if (problem == nullptr) buffer.assign(bytes.begin(), bytes.end());
  }
  service.release();  // it stays the caller's
  if (problem != nullptr) SetAPIErrorMessage("%s", problem);
  return problem == nullptr;
}

bool load_nand_info(const Services& services, nand_exporter_t*& exporter,
                    LegacyNandInfoCxt* context) {
  return loadLegacy(services, exporter, context);
}

bool openZMCConnection(const Services& services, zmc_connection_t& connection) {
  StorageController controller = findController(services);
  connection = {.service = 0, .connection = 0, .exporter = controller.exporter};
  if (!controller.service.isPresent()) {
    services.streams.writeError("Can't get ZMC Connection, no matching service!\n");
    return false;
  }
  nand_exporter_t& exporter = *controller.exporter;
  const auto status = controller.service.open();
  const auto handles = controller.service.release();
  connection.service = handles.service;
  connection.connection = exporter.io_connection = handles.connection;
  if (status != 0) {
    services.streams.writeError(base::format("DrvServiceOpen failed for class '%s', result 0x%x\n",
                                             exporter.className, status));
  }
  const bool hasStats =
      exporter.getStatsSelectors != nullptr && exporter.getStatsSelectors() == getStatsSelectors();
  if (connection.connection != 0 && hasStats) return true;
  services.streams.writeError("Can't get ZMC Connection!\n");
  closeZMCConnection(services, connection);
  return false;
}

void closeZMCConnection(const Services& services, zmc_connection_t& connection) {
  const auto open = std::exchange(connection.connection, 0);
  const DriverService returned(
      services, {.service = std::exchange(connection.service, 0), .connection = open});
  // The record shall not keep a handle that is gone; one that it got since is not ours.
  nand_exporter_t* const exporter = connection.exporter;
  if (open != 0 && exporter != nullptr && exporter->io_connection == open) {
    exporter->io_connection = 0;
  }
}

plist::Value NandRecommendsContentDeletion(const Services& services) {
  return recommendsContentDeletion(services);
}

std::uint64_t GetEANImageSize(const Services& services, std::uint32_t code) {
  return askEAN(services, EANFigure::imageSize, code);
}

std::uint64_t GetEANUpdateCount(const Services& services, std::uint32_t code) {
  return askEAN(services, EANFigure::updateCount, code);
}

}  // namespace NANDInfo
