// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// A folder that lives as long as its object: the device root of a test.
#pragma once

#include <filesystem>
#include <fstream>
#include <iterator>
#include <stdexcept>
#include <string>
#include <string_view>
#include <system_error>

namespace support {

// Where a single-user device's counters lie below its root.
inline constexpr char kCountersDatabase[] = "var/mobile/Library/Pelloran/PLDataStore.sqlitedb";

class TemporaryFolder {
 public:
  TemporaryFolder() {
    std::string pattern = (std::filesystem::temp_directory_path() / "morvend-XXXXXX").string();
    if (::mkdtemp(pattern.data()) == nullptr) throw std::runtime_error("mkdtemp failed");
    path_ = pattern;
  }
  ~TemporaryFolder() {
    std::error_code ignored;
    std::filesystem::remove_all(path_, ignored);
  }
  TemporaryFolder(const TemporaryFolder&) = delete;
  TemporaryFolder& operator=(const TemporaryFolder&) = delete;

  const std::filesystem::path& path() const { return path_; }
  std::filesystem::path operator/(std::string_view below) const { return path_ / below; }

  // Writes a file, making its folders.
  void write(std::string_view below, std::string_view bytes) const {
    const auto file = path_ / below;
    std::filesystem::create_directories(file.parent_path());
    std::ofstream(file, std::ios::binary)
        .write(bytes.data(), static_cast<std::streamsize>(bytes.size()));
  }

  // A file's bytes; empty when there is no such file.
  std::string read(std::string_view below) const {
    std::ifstream file(path_ / below, std::ios::binary);
    return {std::istreambuf_iterator<char>(file), {}};
  }

 private:
  std::filesystem::path path_;
};

}  // namespace support
