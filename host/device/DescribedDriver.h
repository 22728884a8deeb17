// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// A driver as its dictionary in a registry tree describes it.
#pragma once

#include <cstdint>
#include <set>
#include <string>

#include "host/files/DeviceRoot.h"
#include "platform/DeviceRegistry.h"
#include "platform/SystemLog.h"

namespace host {

// What a driver answers to whatever its dictionary doesn't name.
inline constexpr platform::DriverStatus kNotSupported = 0x2D;

// What an open or close that is to fail reports, and a buffer whose file can't be read.
inline constexpr platform::DriverStatus kDriverFailed = 1;

// The files below device/ that hold what drivers answer. One that can't be read is said once, with
// an error line, and counts as a failure of the driver.
class DriverFiles {
 public:
  DriverFiles(const DeviceRoot& root, platform::SystemLog& log) : root_(root), log_(log) {}

  // The size of a file in bytes; none when it isn't a regular file below device/.
  std::optional<std::uint64_t> size(const std::string& name);

  // Fills the output from the file's beginning; the number of bytes.
  std::optional<std::size_t> read(const std::string& name, std::span<std::byte> output);

 private:
  bool isBelowDevice(const std::string& name);
  void say(const std::string& name, const std::string& problem);

  const DeviceRoot& root_;
  platform::SystemLog& log_;
  std::set<std::string> said_;
};

// Answers the calls of one connection; holds nothing but references.
class DescribedDriver {
 public:
  DescribedDriver(const plist::Dictionary& answers, DriverFiles& files)
      : answers_(answers), files_(files) {}

  bool refusesOpen() const { return isSet("RefuseOpen"); }
  bool failsClose() const { return isSet("FailClose"); }

  platform::DriverConnections::CallResult callStructMethod(std::uint32_t method,
                                                           std::span<const std::byte> input,
                                                           std::span<std::byte> output) const;
  platform::DriverStatus callScalarMethod(std::uint32_t method,
                                          std::span<const std::uint64_t> input,
                                          std::span<std::uint64_t> output) const;

 private:
  bool isSet(const char* key) const;
  const plist::Value* bufferFor(std::uint32_t opType, std::uint32_t argument) const;
  platform::DriverConnections::CallResult recommendsDeletion(std::span<std::byte> output) const;
  platform::DriverConnections::CallResult tunnel(std::span<const std::byte> block,
                                                 std::span<std::byte> output) const;

  const plist::Dictionary& answers_;
  DriverFiles& files_;
};

}  // namespace host
