// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The device registry and its drivers: device/registry.plist, which is read at the first question.
// Without the file, or with anything but a dictionary at its top, there is no registry.
#pragma once

#include <cstdint>
#include <optional>
#include <unordered_map>
#include <vector>

#include "host/files/DeviceFile.h"
#include "host/recorded/SimulatedDriver.h"
#include "platform/DeviceRegistry.h"

namespace host::recorded {

// Depth first in file order everywhere, parents before children; a search through parents ends with
// the root. A handle is never given out twice: one that is unknown, of another kind or released
// already has no effect, and its question the answer that there is nothing.
class DeviceRegistry : public platform::DeviceRegistry, public platform::DriverConnections {
 public:
  DeviceRegistry(const DeviceRoot& root, platform::SystemLog& log)
      : log_(log), file_(root, log, "device/registry.plist"), files_(root, log) {}

  // Handles that are still held are said with an error line.
  ~DeviceRegistry() override;

  platform::RegistryObject DrvGetMatchingService(std::string_view className) override;
  platform::RegistryObject rootEntry() override;
  platform::RegistryObject createIterator() override;
  platform::RegistryObject next(platform::RegistryObject iterator) override;
  bool conformsTo(platform::RegistryObject entry, std::string_view className) override;
  std::optional<plist::Value> searchProperty(platform::RegistryObject entry, std::string_view key,
                                             Direction direction) override;
  void release(platform::RegistryObject object) override;

  OpenResult DrvServiceOpen(platform::RegistryObject service, std::uint32_t type) override;
  platform::DriverStatus DrvServiceClose(platform::DriverConnection connection) override;
  CallResult DrvCallStructMethod(platform::DriverConnection connection, std::uint32_t method,
                                 std::span<const std::byte> input,
                                 std::span<std::byte> output) override;
  platform::DriverStatus DrvCallMethod(platform::DriverConnection connection, std::uint32_t method,
                                       std::span<const std::uint64_t> input,
                                       std::span<std::uint64_t> output) override;

 private:
  // In the order of a walk; the root is the first. What lies below an entry follows it, up to
  // `end`.
  struct Entry {
    const plist::Dictionary& content;  // borrowed from the file
    std::size_t parent, end;           // places; the root is its own parent
  };
  enum class Kind : std::uint8_t { entry, iterator, connection };
  struct Handle {
    Kind kind;
    std::size_t place;  // of the entry; of the one that an iterator yields next
  };

  const std::vector<Entry>& entries();
  void add(const plist::Dictionary& content, std::size_t parent);

  std::uint32_t handOut(Kind kind, std::size_t place);
  Handle* held(std::uint32_t handle, Kind kind);
  std::optional<SimulatedDriver> driverAt(std::size_t place);
  std::optional<SimulatedDriver> driverOf(platform::DriverConnection connection);

  platform::SystemLog& log_;
  DeviceFile file_;
  DriverFiles files_;
  std::vector<Entry> entries_;
  bool isRead_ = false;
  std::unordered_map<std::uint32_t, Handle> handles_;
  std::uint32_t lastHandle_ = 0;
};

}  // namespace host::recorded
