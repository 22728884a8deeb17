#include "platform/host/HostDeviceRegistry.h"

namespace platform::host {

RegistryObject HostDeviceRegistry::DrvGetMatchingService(std::string_view) { return 0; }
RegistryObject HostDeviceRegistry::rootEntry() { return 0; }
RegistryObject HostDeviceRegistry::createIterator() { return 0; }
RegistryObject HostDeviceRegistry::next(RegistryObject) { return 0; }
bool HostDeviceRegistry::conformsTo(RegistryObject, std::string_view) { return false; }
std::optional<Value> HostDeviceRegistry::searchProperty(RegistryObject, std::string_view,
                                                        Direction) {
  return std::nullopt;
}
void HostDeviceRegistry::release(RegistryObject) {}
DriverConnections::OpenResult HostDeviceRegistry::DrvServiceOpen(RegistryObject, std::uint32_t) {
  (void)root_, (void)log_;
  return {1, 0};
}
DriverStatus HostDeviceRegistry::DrvServiceClose(DriverConnection) { return 1; }
DriverConnections::CallResult HostDeviceRegistry::DrvCallStructMethod(DriverConnection,
                                                                      std::uint32_t,
                                                                      std::span<const std::byte>,
                                                                      std::span<std::byte>) {
  return {1, 0};
}
DriverStatus HostDeviceRegistry::DrvCallMethod(DriverConnection, std::uint32_t,
                                               std::span<const std::uint64_t>,
                                               std::span<std::uint64_t>) {
  return 1;
}

}  // namespace platform::host
