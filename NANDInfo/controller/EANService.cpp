// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/controller/EANService.h"

#include "NANDInfo/DriverService.h"
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
constexpr Method kImageSize = {kEANImageSizeMethod, "GetEANImageSize", "GetImageSize"};
constexpr Method kUpdateCount = {kEANUpdateCountMethod, "GetEANUpdateCount", "GetUpdateCount"};

char letter(std::uint32_t code, int place) {
  return static_cast<char>(code >> (24 - 8 * place) & 0xFF);
}

}  // namespace

// The service is found and opened anew for each query, so that no connection outlives one.
std::uint64_t askEAN(const ControllerServices& services, EANFigure figure, std::uint32_t code) {
  const Method& method = figure == EANFigure::imageSize ? kImageSize : kUpdateCount;
  const auto unavailable = [&]() -> std::uint64_t {
    services.log.log(
        LogLevel::standard, "%s: Unable to get EAN Io service connection for key (%u): %c%c%c%c\n",
        method.query, code, letter(code, 0), letter(code, 1), letter(code, 2), letter(code, 3));
    return 0;
  };
  auto service = DriverService::matching(services, kEANClassName);
  if (!service.isPresent()) {
    services.log.log(LogLevel::standard, "getEANConnection: Couldn't find %s object\n",
                     kEANClassName);
    return unavailable();
  }
  if (const auto status = service.open(); status != 0) {
    services.log.log(LogLevel::standard,
                     "getEANConnection: DrvServiceOpen on %s failed kernResult:%x\n", kEANClassName,
                     status);
    return unavailable();
  }
  if (!service.isOpen()) return unavailable();

  const std::uint64_t input = code;
  std::uint64_t output = 0;
  const auto status = service.call(method.selector, std::span(&input, 1), std::span(&output, 1));
  if (status == 0) return output;
  services.log.log(LogLevel::standard,
                   "%s: DrvCallMethod failed (key (%u): %c%c%c%c) kernResult:%x\n", method.call,
                   code, letter(code, 0), letter(code, 1), letter(code, 2), letter(code, 3),
                   status);
  return 0;
}

}  // namespace NANDInfo
