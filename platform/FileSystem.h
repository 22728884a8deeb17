// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The files of the device. Paths are absolute paths of the device.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace platform {

class FileSystem {
 public:
  virtual ~FileSystem() = default;

  // The file status of a path: its size in bytes, or none when the status can't be had.
  virtual std::optional<std::uint64_t> fileStatus(std::string_view path) = 0;

  // The size of the file system that holds a path, or none when it can't be had.
  struct Statistics {
    std::uint64_t blockSize;  // bytes
    std::uint64_t blocks;
    std::uint64_t blocksAvailable;  // to the user
  };
  virtual std::optional<Statistics> statfs(std::string_view path) = 0;

  // The bytes of a regular file, at most `maximum` of them; none when it can't be read.
  virtual std::optional<std::string> readFile(std::string_view path, std::size_t maximum) = 0;
};

}  // namespace platform
