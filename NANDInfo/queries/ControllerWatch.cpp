// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/queries/ControllerWatch.h"

#include <algorithm>
#include <span>

#include "NANDInfo/Controller.h"
#include "NANDInfo/DriverService.h"
#include "base/Text.h"
#include "platform/Clock.h"
#include "platform/DeviceProperties.h"
#include "platform/FaultwatchSupport.h"
#include "platform/FileSystem.h"
#include "platform/Kernel.h"
#include "platform/KernelSnapshots.h"
#include "platform/LogSubmission.h"
#include "platform/PreferenceStore.h"
#include "platform/PurgeableSpace.h"
#include "platform/SystemLog.h"

namespace NANDInfo {

using platform::DriverConnection;
using platform::DriverStatus;
using platform::RegistryObject;

namespace {

std::span<const nand_exporter_t> exporters() { return {nand_exporters_tunnel, kExporters}; }

bool isController(std::string_view className) {
  for (const auto& exporter : exporters()) {
    if (className == exporter.className) return true;
  }
  return false;
}

std::string controllerNames() {
  std::string names;
  for (const auto& exporter : exporters()) {
    names.append(names.empty() ? "" : ", ").append(exporter.className);
  }
  return names;
}

// The size phase of a tunnel command, which tells nothing yet.
bool asksForSize(std::span<const std::byte> input) {
  constexpr std::size_t kFlags = 4;
  return input.size() > kFlags && (input[kFlags] & std::byte{1}) != std::byte{0};
}

// The services as the library is to see them: these four stand before the device's own.
struct Watched : Services {
  platform::StandardStreams& streams;
  platform::Eventra& eventra;
  platform::DeviceRegistry& registry;
  platform::DriverConnections& drivers;
};

Services watched(const Watched& services) {
  Services seen(services);
  seen.exporters = services.exporters;
  return seen;
}

}  // namespace

ControllerWatch::ControllerWatch(const Services& inner, DirectTexts texts)
    : inner_(inner), directTexts_(texts), services_(watched({inner, *this, *this, *this, *this})) {}

std::string ControllerWatch::problem() {
  if (!lookedUp_) {
    for (const auto& exporter : exporters()) {
      DriverService::walkedTo(services_, exporter.className);
    }
  }
  if (found_.empty()) {
    return "no storage controller found: the device registry offers none of " + controllerNames();
  }
  if (stage_ == Stage::nothing) {
    // The library knew that it needn't ask. Whether it could have, is seen by opening.
    DriverService::walkedTo(services_, found_).open();
  }
  if (answered_ || stage_ == Stage::opened) return {};
  const std::string status =
      lastFailure_ != 0 ? base::format(" (status 0x%x)", lastFailure_) : std::string();
  return "the storage controller " + found_ +
         (stage_ == Stage::asked ? " answers no command" : " can't be opened") + status;
}

void ControllerWatch::noteLookUp(std::string_view className, RegistryObject found) {
  if (!isController(className)) return;
  lookedUp_ = true;
  if (found == 0) return;
  found_ = className;
  controllers_.insert(found);
}

RegistryObject ControllerWatch::DrvGetMatchingService(std::string_view className) {
  const RegistryObject found = inner_.registry.DrvGetMatchingService(className);
  noteLookUp(className, found);
  return found;
}

bool ControllerWatch::conformsTo(RegistryObject entry, std::string_view className) {
  const bool conforms = inner_.registry.conformsTo(entry, className);
  noteLookUp(className, conforms ? entry : 0);
  return conforms;
}

platform::DriverConnections::OpenResult ControllerWatch::DrvServiceOpen(RegistryObject service,
                                                                        std::uint32_t type) {
  const OpenResult result = inner_.drivers.DrvServiceOpen(service, type);
  if (controllers_.contains(service)) {
    if (result.status != 0) lastFailure_ = result.status;
    stage_ = std::max(stage_, result.status == 0 ? Stage::opened : Stage::refused);
    if (result.connection != 0) connections_.insert(result.connection);
  }
  return result;
}

platform::DriverConnections::CallResult ControllerWatch::DrvCallStructMethod(
    DriverConnection connection, std::uint32_t method, std::span<const std::byte> input,
    std::span<std::byte> output) {
  const CallResult result = inner_.drivers.DrvCallStructMethod(connection, method, input, output);
  if (connections_.contains(connection)) {
    stage_ = Stage::asked;
    if (result.status != 0) lastFailure_ = result.status;
    if (result.status == 0 && !asksForSize(input)) answered_ = true;
  }
  return result;
}

bool ControllerWatch::EventraSendEventLazy(std::string_view event, PayloadProducer producer) {
  if (answered_) {
    sendEvents();
    return inner_.eventra.EventraSendEventLazy(event, std::move(producer));
  }
  events_.emplace_back(event, std::move(producer));
  return inner_.eventra.EventraIsEventUsed(event);
}

void ControllerWatch::sendEvents() {
  for (auto& [event, producer] : std::exchange(events_, {})) {
    inner_.eventra.EventraSendEventLazy(event, std::move(producer));
  }
}

void ControllerWatch::writeError(std::string_view text) {
  if (directTexts_ == DirectTexts::passed) return inner_.streams.writeError(text);
  while (text.ends_with('\n')) text.remove_suffix(1);
  // "trying iterator...": a text that says what goes on, not what went wrong.
  if (!text.ends_with("...")) texts_.emplace_back(text);
}

}  // namespace NANDInfo
