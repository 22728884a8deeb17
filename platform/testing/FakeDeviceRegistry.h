// A device registry in memory, whose controller follows a script.
#pragma once

#include "platform/DeviceRegistry.h"

namespace platform::fakes {

class FakeDeviceRegistry : public DeviceRegistry, public DriverConnections {
 public:
  RegistryObject DrvGetMatchingService(std::string_view) override { return 0; }
  RegistryObject rootEntry() override { return 0; }
  RegistryObject createIterator() override { return 0; }
  RegistryObject next(RegistryObject) override { return 0; }
  bool conformsTo(RegistryObject, std::string_view) override { return false; }
  std::optional<Value> searchProperty(RegistryObject, std::string_view, Direction) override {
    return std::nullopt;
  }
  void release(RegistryObject) override {}
  OpenResult DrvServiceOpen(RegistryObject, std::uint32_t) override { return {1, 0}; }
  DriverStatus DrvServiceClose(DriverConnection) override { return 1; }
  CallResult DrvCallStructMethod(DriverConnection, std::uint32_t, std::span<const std::byte>,
                                 std::span<std::byte>) override {
    return {1, 0};
  }
  DriverStatus DrvCallMethod(DriverConnection, std::uint32_t, std::span<const std::uint64_t>,
                             std::span<std::uint64_t>) override {
    return 1;
  }
};

}  // namespace platform::fakes
