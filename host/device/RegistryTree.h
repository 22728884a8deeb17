// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// A device registry and its drivers as a dictionary describes them, whoever makes it.
#pragma once

#include <cstdint>
#include <optional>
#include <unordered_map>
#include <vector>

#include "host/device/DescribedDriver.h"
#include "platform/DeviceRegistry.h"

namespace host {

// An entry has "Class", "Conforms", "Registered", "Properties", "Children" and "Driver"; the top of
// the tree is the registry's root. Depth first in the order of the children everywhere, parents
// before children; a search through parents ends with the root. A handle is never given out twice:
// one that is unknown, of another kind or released already has no effect, and its question the
// answer that there is nothing.
class RegistryTree : public platform::DeviceRegistry, public platform::DriverConnections {
 public:
  // `root` is where files lie that drivers answer from.
  RegistryTree(const DeviceRoot& root, platform::SystemLog& log) : log_(log), files_(root, log) {}

  // Handles that are still held are said with an error line.
  ~RegistryTree() override;

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
  std::optional<DescribedDriver> driverAt(std::size_t place);
  std::optional<DescribedDriver> driverOf(platform::DriverConnection connection);

  // The tree, or null: there is no registry. Asked once, at the first question; it stays where it
  // is for as long as the registry.
  virtual const plist::Dictionary* tree() = 0;

  platform::SystemLog& log_;
  DriverFiles files_;
  std::vector<Entry> entries_;
  bool isRead_ = false;
  std::unordered_map<std::uint32_t, Handle> handles_;
  std::uint32_t lastHandle_ = 0;
};

}  // namespace host
