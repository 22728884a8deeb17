// The assembled host on a device root, as a single-user device has it.
#pragma once

#include <filesystem>
#include <string>

#include "platform/host/Host.h"

namespace support {

struct HostOnRoot : platform::host::Host {
  explicit HostOnRoot(const std::filesystem::path& root,
                      platform::LogLevel lowest = platform::LogLevel::standard)
      : Host({.root = root.string(), .lowestLevel = lowest}) {
    keepCountersBelow([this] { return &home; });
  }

  std::string home = "/var/mobile";
};

inline constexpr char kCountersDatabase[] = "var/mobile/Library/Pelloran/PLDataStore.sqlitedb";

}  // namespace support
