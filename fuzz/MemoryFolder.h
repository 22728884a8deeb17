// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// A folder in memory, for targets that read files.
#pragma once

#include <unistd.h>

#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <string_view>

#include "Input.h"

namespace fuzz {

struct MemoryFolder {
  explicit MemoryFolder(const std::string& below) {
    const bool inMemory = std::filesystem::is_directory("/dev/shm");
    std::string name = std::string(inMemory ? "/dev/shm" : "/tmp") + "/fuzz-XXXXXX";
    require(::mkdtemp(name.data()) != nullptr, "there is a folder");
    path = name;
    std::filesystem::create_directories(path / below);
  }
  ~MemoryFolder() { std::filesystem::remove_all(path); }
  MemoryFolder(const MemoryFolder&) = delete;
  MemoryFolder& operator=(const MemoryFolder&) = delete;

  std::filesystem::path path;
};

inline void writeFile(const std::filesystem::path& path, std::string_view bytes) {
  std::ofstream(path, std::ios::binary) << bytes;
}

inline std::string readFile(const std::filesystem::path& path) {
  std::ifstream file(path, std::ios::binary);
  return {std::istreambuf_iterator<char>(file), {}};
}

}  // namespace fuzz
