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

namespace {

std::optional<std::uint64_t> amount(const plist::Dictionary& figures, const char* key) {
  const plist::Number* number = figures.number(key);
  if (number == nullptr || number->int64Value() < 0) return std::nullopt;
  return number->uint64Value();
}

}  // namespace

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
  if (!root_.isRecorded()) return fileSystemHolding(root_, path);
  const plist::Dictionary* properties = properties_.dictionary();
  const plist::Dictionary* recorded = properties ? properties->dictionary("FileSystem") : nullptr;
  if (recorded == nullptr) return std::nullopt;
  const auto blockSize = amount(*recorded, "BlockSize"), blocks = amount(*recorded, "Blocks"),
             available = amount(*recorded, "BlocksAvailable");
  if (!blockSize || !blocks || !available) return std::nullopt;
  return Statistics{*blockSize, *blocks, *available};
}

std::optional<std::string> DeviceFileSystem::readFile(std::string_view path, std::size_t maximum) {
  return root_.readFile(path, maximum).orNone();
}

}  // namespace host
