// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// A service of the device registry and the connection to its driver. The one owner of both handles:
// whatever becomes of a call, they are given back when the object goes.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <memory>
#include <optional>
#include <span>
#include <string_view>

#include "base/Exported.h"
#include "platform/DeviceRegistry.h"

namespace MORVEND_EXPORTED NANDInfo {

// What it takes to reach a driver.
struct DriverAccess {
  platform::DeviceRegistry& registry;
  platform::DriverConnections& drivers;

  // Out of whatever has both under these names.
  template <typename Source>
  DriverAccess(const Source& source) : registry(source.registry), drivers(source.drivers) {}
};

// The op types of a tunnel command: of its size phase and of its data phase.
struct SelectorPair {
  std::uint32_t sizeOpType, dataOpType;
};

// A driver that announces more than this is treated as if the memory were refused.
inline constexpr std::size_t kMaxBuffer = std::size_t{16} << 20;

// A question whose answer is as long as the driver says: its block of 24 bytes goes to the driver
// twice, first for the size, then for the data.
struct TunnelCommand {
  std::uint32_t sizeMethod, dataMethod;  // of the driver
  SelectorPair opTypes;
  std::uint32_t flags = 0;  // beside the lowest, which the size phase has
  std::uint32_t argument = 0;
  std::uint32_t inLength = 0;
  std::uint64_t inBuffer = 0;
  bool fetchesNothing = true;  // a size of 0 has a data phase, too
};

// What came of it. The memory begins at a page, as drivers want it, and is zero where nothing was
// delivered.
class TunnelAnswer {
 public:
  enum class Failure : std::uint8_t { none, size, memory, data };

  Failure failure = Failure::none;    // what ended it
  platform::DriverStatus status = 0;  // of the call that failed
  std::uint32_t announced = 0;        // bytes, also of an answer that failed later

  // As much as was announced, and as much as was delivered; both empty after a failure.
  std::span<const std::byte> whole() const { return {memory_.get(), memory_ ? announced : 0}; }
  std::span<const std::byte> delivered() const { return whole().first(delivered_); }

 private:
  friend class DriverService;
  struct Free {
    void operator()(std::byte* memory) const { std::free(memory); }
  };

  std::unique_ptr<std::byte[], Free> memory_;
  std::size_t delivered_ = 0;
};

class DriverService {
 public:
  // The first service of a class that the registry matches, or the first entry of a walk of the
  // whole service plane that conforms to the class. It may be that there is none.
  static DriverService matching(const DriverAccess& access, std::string_view className);
  static DriverService walkedTo(const DriverAccess& access, std::string_view className);

  DriverService(DriverService&& other) noexcept;
  DriverService& operator=(DriverService&&) = delete;
  ~DriverService();

  bool isPresent() const { return handles_.service != 0; }

  // Opens it for the process's own task. A driver may succeed without a connection.
  platform::DriverStatus open();
  bool isOpen() const { return handles_.connection != 0; }

  // Closes now; what isn't open closes well.
  platform::DriverStatus close();

  // A property of the entry or of what lies in that direction.
  std::optional<plist::Value> property(std::string_view key,
                                       platform::DeviceRegistry::Direction direction) const;

  // The exchange of a tunnel command, and the driver's other methods, over the connection.
  TunnelAnswer exchange(const TunnelCommand& command) const;
  platform::DriverConnections::CallResult call(std::uint32_t method,
                                               std::span<std::byte> output) const;
  platform::DriverStatus call(std::uint32_t method, std::span<const std::uint64_t> input,
                              std::span<std::uint64_t> output) const;

  // For records that keep handles between two calls: each handle is its holder's, or this object's.
  struct Handles {
    platform::RegistryObject service = 0;
    platform::DriverConnection connection = 0;
  };
  DriverService(const DriverAccess& access, const Handles& handles)
      : access_(access), handles_(handles) {}
  Handles release();

 private:
  const DriverAccess access_;
  Handles handles_;
};

}  // namespace NANDInfo
