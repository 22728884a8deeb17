// The device registry and its drivers: device/registry.plist.
#pragma once

#include "platform/DeviceRegistry.h"
#include "platform/host/DeviceFile.h"

namespace platform::host {

class HostDeviceRegistry : public DeviceRegistry, public DriverConnections {
 public:
  HostDeviceRegistry(const DeviceRoot& root, PropertyListCodec& codec, SystemLog& log)
      : root_(root), log_(log), file_(root, codec, log, "device/registry.plist") {}

  RegistryObject DrvGetMatchingService(std::string_view className) override;
  RegistryObject rootEntry() override;
  RegistryObject createIterator() override;
  RegistryObject next(RegistryObject iterator) override;
  bool conformsTo(RegistryObject entry, std::string_view className) override;
  std::optional<Value> searchProperty(RegistryObject entry, std::string_view key,
                                      Direction direction) override;
  void release(RegistryObject object) override;

  OpenResult DrvServiceOpen(RegistryObject service, std::uint32_t type) override;
  DriverStatus DrvServiceClose(DriverConnection connection) override;
  CallResult DrvCallStructMethod(DriverConnection connection, std::uint32_t method,
                                 std::span<const std::byte> input,
                                 std::span<std::byte> output) override;
  DriverStatus DrvCallMethod(DriverConnection connection, std::uint32_t method,
                             std::span<const std::uint64_t> input,
                             std::span<std::uint64_t> output) override;

 private:
  const DeviceRoot& root_;
  SystemLog& log_;
  DeviceFile file_;
};

}  // namespace platform::host
