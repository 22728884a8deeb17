// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/files/DeviceFileSystem.h"

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include <sys/stat.h>
#include <sys/statvfs.h>

namespace host {

std::optional<platform::FileSystem::Statistics> fileSystemHolding(const DeviceRoot& root,
                                                                  std::string_view path) {
  const auto file = root.openForStatus(path);
  struct statvfs status;
  if (!file || ::fstatvfs(file->get(), &status) != 0) return std::nullopt;
  return platform::FileSystem::Statistics{status.f_frsize, status.f_blocks, status.f_bavail};
}

std::optional<std::uint64_t> DeviceFileSystem::fileStatus(std::string_view path) {
  const auto file = root_.openForStatus(path);
  struct stat status;
  if (!file || ::fstat(file->get(), &status) != 0) return std::nullopt;
  return static_cast<std::uint64_t>(status.st_size);
}

std::optional<platform::FileSystem::Statistics> DeviceFileSystem::statfs(std::string_view path) {
  return fileSystemHolding(root_, path);
}

std::optional<std::string> DeviceFileSystem::readFile(std::string_view path, std::size_t maximum) {
  return root_.readFile(path, maximum).orNone();
}

}  // namespace host
