// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The device registry and the drivers behind its entries.
//
// Entries, iterators and connections are counted handles: each one that a call hands out is given
// back once, with release() or DrvServiceClose().
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <span>
#include <string_view>

#include "plist/Value.h"

namespace platform {

// An entry of the registry, or an iterator over it; 0 is none.
using RegistryObject = std::uint32_t;

// An open connection to a driver; 0 is none.
using DriverConnection = std::uint32_t;

// What a driver call came to; 0 is success.
using DriverStatus = std::uint32_t;

// The property under which an entry carries its own matching description.
inline constexpr char kRegistryPropertyMatchKey[] = "PropertyMatch";

// The property under which this machine's registry describes a drive: a dictionary of "name",
// "kind", "model", "serial", "firmware", "capacity" in bytes, "holdsRoot", and "figures" (a
// dictionary of numbers) or, without figures, "unknown", the reason. What isn't known is left out.
inline constexpr char kRegistryDriveKey[] = "Drive";

class DeviceRegistry {
 public:
  enum class Direction { children, parents };  // of a search, the entry itself always included

  virtual ~DeviceRegistry() = default;

  // The first registered service of a class, or of a class that conforms to it; 0 when none is.
  virtual RegistryObject DrvGetMatchingService(std::string_view className) = 0;

  // The root entry; 0 when there is no registry.
  virtual RegistryObject rootEntry() = 0;

  // An iterator over all entries of the service plane below the root, registered or not; 0 when
  // there can be none. `next` is 0 at its end.
  virtual RegistryObject createIterator() = 0;
  virtual RegistryObject next(RegistryObject iterator) = 0;

  // Whether the entry is of the class or of one that conforms to it.
  virtual bool conformsTo(RegistryObject entry, std::string_view className) = 0;

  // The value of a property on the entry or on what lies in the direction of the search: its
  // parents from the nearest up, or all below it in the order of a walk. None when it is nowhere.
  virtual std::optional<plist::Value> searchProperty(RegistryObject entry, std::string_view key,
                                                     Direction direction) = 0;

  virtual void release(RegistryObject object) = 0;
};

class DriverConnections {
 public:
  struct OpenResult {
    DriverStatus status;
    DriverConnection connection;  // may be 0 on success, and open on an error
  };
  struct CallResult {
    DriverStatus status;
    std::size_t outputSize;  // bytes, as the driver says; to be checked against the output
  };

  virtual ~DriverConnections() = default;

  // Opens a connection for the process's own task.
  virtual OpenResult DrvServiceOpen(RegistryObject service, std::uint32_t type) = 0;

  // Closes it; the handle is gone even when the close reports an error.
  virtual DriverStatus DrvServiceClose(DriverConnection connection) = 0;

  // Calls a method that takes and fills a block of bytes; the output's size is the capacity.
  virtual CallResult DrvCallStructMethod(DriverConnection connection, std::uint32_t method,
                                         std::span<const std::byte> input,
                                         std::span<std::byte> output) = 0;

  // Calls a method that takes and fills scalars.
  virtual DriverStatus DrvCallMethod(DriverConnection connection, std::uint32_t method,
                                     std::span<const std::uint64_t> input,
                                     std::span<std::uint64_t> output) = 0;
};

}  // namespace platform
