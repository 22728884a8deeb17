// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/controller/StorageController.h"

#include <array>
#include <utility>

#include "NANDInfo/APIErrorMessage.h"
#include "base/ByteReader.h"
#include "platform/StandardStreams.h"
#include "platform/SystemLog.h"

namespace NANDInfo {

using platform::LogLevel;
using Failure = TunnelAnswer::Failure;

namespace {

constexpr char kNoConnection[] = "Could not get connection to service\n";
constexpr char kNotClosed[] = "Could not close connection to service\n";

}  // namespace

StorageController findController(const ControllerServices& services) {
  auto* row = services.exporters;
  for (; row->className != nullptr; ++row) {
    auto service = DriverService::matching(services, row->className);
    if (!service.isPresent()) continue;
    services.log.log(LogLevel::standard, "NANDInfo: findNandExporter: Controller found: %s\n",
                     row->className);
    return {row, std::move(service)};
  }
  services.streams.writeError(
      "Failed to find matching service with DrvGetMatchingService, trying iterator...\n");
  for (row = services.exporters; row->className != nullptr; ++row) {
    auto service = DriverService::walkedTo(services, row->className);
    if (!service.isPresent()) continue;
    services.log.log(LogLevel::standard, "Find service for class %s\n", row->className);
    return {row, std::move(service)};
  }
  return {row, DriverService(services, {})};
}

std::optional<StorageController> openController(const ControllerServices& services) {
  for (auto* row = services.exporters; row->className != nullptr; ++row) {
    auto service = DriverService::matching(services, row->className);
    if (!service.isPresent() || service.open() != 0) continue;
    services.log.log(LogLevel::standard, "NANDInfo: findNandExporterNew: Controller found: %s\n",
                     row->className);
    return StorageController{row, std::move(service)};
  }
  return std::nullopt;
}

const char* obstacle(const DriverService& service, const nand_exporter_t* exporter,
                     const SelectorPair* selectors) {
  if (!service.isOpen()) return "executeTunnelCommand: Invalid connection";
  if (exporter == nullptr || exporter->sizeSelector == 0 || exporter->dataSelector == 0) {
    return "executeTunnelCommand: Invalid exporter";
  }
  return selectors == nullptr ? "executeTunnelCommand: Invalid opType Selector" : nullptr;
}

const char* failureText(Failure failure) {
  switch (failure) {
    case Failure::size:
      return "executeTunnelCommand: DrvCallStructMethod failed while retrieving data size";
    case Failure::memory:
      return "executeTunnelCommand: Could not allocate buffer";
    case Failure::data:
      return "executeTunnelCommand: DrvCallStructMethod failed while retrieving data";
    case Failure::none:
      break;
  }
  return nullptr;
}

base::Result<TunnelAnswer> fetchStatistics(const StorageController& controller,
                                           const SelectorPair* selectors, std::uint32_t argument) {
  const auto& [exporter, service] = controller;
  if (const char* text = obstacle(service, exporter, selectors)) return base::Error{text};
  // The driver is given the place of a buffer of length 0.
  const Buffer none;
  auto answer = service.exchange({.sizeMethod = exporter->sizeSelector,
                                  .dataMethod = exporter->dataSelector,
                                  .opTypes = *selectors,
                                  .argument = argument,
                                  .inBuffer = reinterpret_cast<std::uintptr_t>(&none)});
  if (const char* text = failureText(answer.failure)) return base::Error{text};
  return base::Result<TunnelAnswer>(std::move(answer));
}

bool loadLegacy(const ControllerServices& services, nand_exporter_t*& exporter,
                LegacyNandInfoCxt* context) {
  StorageController controller = findController(services);
  exporter = controller.exporter;
  if (!controller.service.isPresent()) {
    services.streams.writeError("Could not get matching Regmora service for exporting classes\n");
    return false;
  }
  if (controller.service.open() != 0) {
    services.streams.writeError(kNoConnection);
    return false;
  }
  const auto answer = fetchStatistics(controller, exporter->getStatsSelectors(), 0);
  if (!answer) SetAPIErrorMessage("%s", answer.error().text.c_str());
  const bool parsed = answer && exporter->parseLegacy != nullptr &&
                      exporter->parseLegacy(context, answer->delivered());
  if (controller.service.close() == 0) return parsed;
  services.streams.writeError(kNotClosed);
  return false;
}

bool recommendsContentDeletion(const ControllerServices& services) {
  StorageController controller = findController(services);
  const std::uint32_t method = controller.exporter->recommendDeletionSelector;
  if (method == kNoSelector) return false;
  if (!controller.service.isPresent()) {
    services.streams.writeError(
        "_load_nand_infoCould not get matching Regmora service for exporting classes\n");
    return false;
  }
  if (controller.service.open() != 0) {
    services.streams.writeError(kNoConnection);
    return false;
  }
  std::array<std::byte, 4> output{};
  const auto answer = controller.service.call(method, output);
  if (controller.service.close() != 0) services.streams.writeError(kNotClosed);
  return answer.status == 0 && answer.outputSize > 3 &&
         base::littleEndian<std::uint32_t>(output) != 0;
}

}  // namespace NANDInfo
