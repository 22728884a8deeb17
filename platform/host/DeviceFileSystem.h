// The device's files as the core sees them: below the device root, links followed within it.
#pragma once

#include "platform/FileSystem.h"
#include "platform/host/DeviceRoot.h"

namespace platform::host {

class DeviceFileSystem final : public FileSystem {
 public:
  // The root is borrowed.
  explicit DeviceFileSystem(const DeviceRoot& root) : root_(root) {}

  std::optional<std::uint64_t> fileStatus(std::string_view path) override;
  std::optional<Statistics> statfs(std::string_view path) override;
  std::optional<std::string> readFile(std::string_view path, std::size_t maximum) override;

 private:
  const DeviceRoot& root_;
};

}  // namespace platform::host
