// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Watches what the storage library asks the storage controller for, so that a command can tell an
// answer from a result that only looks like one.
#pragma once

#include <set>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "NANDInfo/Services.h"
#include "platform/DeviceRegistry.h"
#include "platform/Eventra.h"
#include "platform/StandardStreams.h"

namespace NANDInfo {

class ControllerWatch : private platform::DeviceRegistry,
                        private platform::DriverConnections,
                        private platform::Eventra,
                        private platform::StandardStreams {
 public:
  // Keeps the texts that are written to standard error directly, or lets them pass.
  enum class DirectTexts { kept, passed };
  ControllerWatch(const Services& inner, DirectTexts texts);

  // The inner services, watched.
  const Services& services() { return services_; }

  // Why nothing that the library said can come from a controller: none is there, none can be
  // opened, or it answered no command. The empty text when one was asked and answered something, or
  // when one that can be opened was asked nothing.
  std::string problem();

  // Events wait until a controller has answered; this sends those that still wait.
  void sendEvents();

  // What was kept.
  const std::vector<std::string>& texts() const { return texts_; }

 private:
  platform::RegistryObject DrvGetMatchingService(std::string_view className) override;
  platform::RegistryObject rootEntry() override { return inner_.registry.rootEntry(); }
  platform::RegistryObject createIterator() override { return inner_.registry.createIterator(); }
  platform::RegistryObject next(platform::RegistryObject iterator) override {
    return inner_.registry.next(iterator);
  }
  bool conformsTo(platform::RegistryObject entry, std::string_view className) override;
  std::optional<plist::Value> searchProperty(platform::RegistryObject entry, std::string_view key,
                                             Direction direction) override {
    return inner_.registry.searchProperty(entry, key, direction);
  }
  void release(platform::RegistryObject object) override { inner_.registry.release(object); }

  OpenResult DrvServiceOpen(platform::RegistryObject service, std::uint32_t type) override;
  platform::DriverStatus DrvServiceClose(platform::DriverConnection connection) override {
    return inner_.drivers.DrvServiceClose(connection);
  }
  CallResult DrvCallStructMethod(platform::DriverConnection connection, std::uint32_t method,
                                 std::span<const std::byte> input,
                                 std::span<std::byte> output) override;
  platform::DriverStatus DrvCallMethod(platform::DriverConnection connection, std::uint32_t method,
                                       std::span<const std::uint64_t> input,
                                       std::span<std::uint64_t> output) override {
    return inner_.drivers.DrvCallMethod(connection, method, input, output);
  }

  bool offersLazySend() override { return inner_.eventra.offersLazySend(); }
  bool EventraIsEventUsed(std::string_view event) override {
    return inner_.eventra.EventraIsEventUsed(event);
  }
  bool EventraSendEventLazy(std::string_view event, PayloadProducer producer) override;

  void writeError(std::string_view text) override;
  void writeOutput(std::string_view text) override { inner_.streams.writeOutput(text); }

  void noteLookUp(std::string_view className, platform::RegistryObject found);

  const Services inner_;
  const DirectTexts directTexts_;
  std::vector<std::string> texts_;
  std::vector<std::pair<std::string, PayloadProducer>> events_;  // that wait
  bool lookedUp_ = false, answered_ = false;
  enum class Stage { nothing, refused, opened, asked } stage_ = Stage::nothing;  // the farthest
  std::string found_;                                 // the class of the last one that was found
  std::set<platform::RegistryObject> controllers_;    // every handle that was given out
  std::set<platform::DriverConnection> connections_;  // to controllers
  platform::DriverStatus lastFailure_ = 0;            // of an opening or a command; 0: none so far
  const Services services_;
};

}  // namespace NANDInfo
