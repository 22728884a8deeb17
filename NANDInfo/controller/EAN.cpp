#include "NANDInfo/EAN.h"

#include "NANDInfo/Services.h"
#include "NANDInfo/controller/DriverHandles.h"
#include "platform/DeviceRegistry.h"
#include "platform/SystemLog.h"

namespace NANDInfo {

namespace {

using platform::LogLevel;

// A query, and the names that it has in messages.
struct Method {
  std::uint32_t selector;
  const char* query;
  const char* call;
};
constexpr Method kImageSize = {3, "GetEANImageSize", "GetImageSize"};
constexpr Method kUpdateCount = {7, "GetEANUpdateCount", "GetUpdateCount"};

char letter(std::uint32_t code, int place) {
  return static_cast<char>(code >> (24 - 8 * place) & 0xFF);
}

// The service is found and opened anew for each query, so that no connection outlives one.
std::uint64_t ask(const Services& services, const Method& method, std::uint32_t code) {
  const auto unavailable = [&]() -> std::uint64_t {
    services.log.log(
        LogLevel::standard, "%s: Unable to get EAN Io service connection for key (%u): %c%c%c%c\n",
        method.query, code, letter(code, 0), letter(code, 1), letter(code, 2), letter(code, 3));
    return 0;
  };
  const RegistryHandle service(services, services.registry.DrvGetMatchingService(kEANClassName));
  if (service.get() == 0) {
    services.log.log(LogLevel::standard, "getEANConnection: Couldn't find %s object\n",
                     kEANClassName);
    return unavailable();
  }
  const DriverHandle connection(services, service.get());
  if (connection.status() != 0) {
    services.log.log(LogLevel::standard,
                     "getEANConnection: DrvServiceOpen on %s failed kernResult:%x\n", kEANClassName,
                     connection.status());
  }
  if (connection.status() != 0 || connection.get() == 0) return unavailable();

  const std::uint64_t input = code;
  std::uint64_t output = 0;
  const auto status = services.drivers.DrvCallMethod(connection.get(), method.selector,
                                                     std::span(&input, 1), std::span(&output, 1));
  if (status != 0) {
    services.log.log(LogLevel::standard,
                     "%s: DrvCallMethod failed (key (%u): %c%c%c%c) kernResult:%x\n", method.call,
                     code, letter(code, 0), letter(code, 1), letter(code, 2), letter(code, 3),
                     status);
    return 0;
  }
  return output;
}

}  // namespace

std::uint64_t GetEANImageSize(const Services& services, std::uint32_t code) {
  return ask(services, kImageSize, code);
}

std::uint64_t GetEANUpdateCount(const Services& services, std::uint32_t code) {
  return ask(services, kUpdateCount, code);
}

}  // namespace NANDInfo
