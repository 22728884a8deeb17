// A driver as its dictionary in the registry file describes it.
#pragma once

#include <cstdint>
#include <set>
#include <string>

#include "platform/DeviceRegistry.h"
#include "platform/SystemLog.h"
#include "platform/host/DeviceRoot.h"

namespace platform::host {

// What a driver answers to whatever its dictionary doesn't name.
inline constexpr DriverStatus kNotSupported = 0x2D;

// What an open or close that is to fail reports, and a buffer whose file can't be read.
inline constexpr DriverStatus kDriverFailed = 1;

// The files below device/ that hold what drivers answer. One that can't be read is said once, with
// an error line, and counts as a failure of the driver.
class DriverFiles {
 public:
  DriverFiles(const DeviceRoot& root, SystemLog& log) : root_(root), log_(log) {}

  // The size of a file in bytes; none when it isn't a regular file below device/.
  std::optional<std::uint64_t> size(const std::string& name);

  // Fills the output from the file's beginning; the number of bytes.
  std::optional<std::size_t> read(const std::string& name, std::span<std::byte> output);

 private:
  bool isBelowDevice(const std::string& name);
  void say(const std::string& name, const char* problem);

  const DeviceRoot& root_;
  SystemLog& log_;
  std::set<std::string> said_;
};

// Answers the calls of one connection; holds nothing but references.
class SimulatedDriver {
 public:
  SimulatedDriver(const Dictionary& answers, DriverFiles& files)
      : answers_(answers), files_(files) {}

  bool refusesOpen() const { return isSet("RefuseOpen"); }
  bool failsClose() const { return isSet("FailClose"); }

  DriverConnections::CallResult callStructMethod(std::uint32_t method,
                                                 std::span<const std::byte> input,
                                                 std::span<std::byte> output) const;
  DriverStatus callScalarMethod(std::uint32_t method, std::span<const std::uint64_t> input,
                                std::span<std::uint64_t> output) const;

 private:
  bool isSet(const char* key) const;
  const Value* bufferFor(std::uint32_t opType, std::uint32_t argument) const;
  DriverConnections::CallResult recommendsDeletion(std::span<std::byte> output) const;
  DriverConnections::CallResult tunnel(std::span<const std::byte> block,
                                       std::span<std::byte> output) const;

  const Dictionary& answers_;
  DriverFiles& files_;
};

}  // namespace platform::host
