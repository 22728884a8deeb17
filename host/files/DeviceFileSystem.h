// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The device's files as the core sees them: below the device root, links followed within it.
#pragma once

#include "host/files/DeviceRoot.h"
#include "platform/FileSystem.h"

namespace host {

class DeviceFileSystem : public platform::FileSystem {
 public:
  explicit DeviceFileSystem(const DeviceRoot& root) : root_(root) {}

  std::optional<std::uint64_t> fileStatus(std::string_view path) override;
  std::optional<Statistics> statfs(std::string_view path) override;
  std::optional<std::string> readFile(std::string_view path, std::size_t maximum) override;

 private:
  const DeviceRoot& root_;
};

// The figures of this machine's file system that holds a path of the device.
std::optional<platform::FileSystem::Statistics> fileSystemHolding(const DeviceRoot& root,
                                                                  std::string_view path);

}  // namespace host
