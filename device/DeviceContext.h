// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Probes that tell what kind of device this is and where its counters data lie.
//
// What doesn't change during the life of the process is asked once and kept here.
// PLIsInternalDevice and homeOfCounters may be called from several threads; the others belong
// to the main thread.
#pragma once

#include <cstdint>
#include <mutex>
#include <optional>
#include <string>

#include "platform/DeviceProperties.h"
#include "platform/FaultwatchSupport.h"
#include "platform/FileSystem.h"
#include "platform/LibraryLoader.h"
#include "platform/SystemLog.h"

namespace morvend {

class DeviceContext {
 public:
  DeviceContext(platform::DeviceProperties& properties, platform::FileSystem& files,
                platform::LibraryLoader& libraries, platform::SystemLog& log)
      : properties_(properties), files_(files), libraries_(libraries), log_(log) {}
  // Out of whatever has these services.
  template <typename Source>
  explicit DeviceContext(const Source& source)
      : DeviceContext(source.deviceProperties, source.files, source.libraries, source.log) {}
  DeviceContext(const DeviceContext&) = delete;
  DeviceContext& operator=(const DeviceContext&) = delete;

  // Whether this is an internal (development) build: the device property "InternalBuild".
  bool PLIsInternalDevice();

  // The home directory of the counters data, as a device path: "/var/mobile", or the system group
  // container of the analytics service on a multi-user device. Null when that container can't be
  // had; it is then asked for again at the next call. The text is borrowed and stays valid.
  const std::string* GetHomeDirectoryPath();

  // The same directory for the counters service itself, which needs it at any time: nothing is
  // said, and nothing kept.
  std::optional<std::string> homeOfCounters();

  // The size of the counters database in whole MiB, or -1 when it can't be examined.
  std::int64_t GetCountersDatabaseSizeMB();

  // How often the counters database was found corrupt since the last call: the preference
  // "DatabaseCorruptionCount" of "com.norba.pellorand", read and set to 0. 0, and nothing is
  // changed, when the preference functions can't be loaded.
  std::int64_t ReadAndResetDatabaseCorruptionCount();

 private:
  bool isForcedToMultiUserMode();
  bool isMultiUserDevice();
  bool determineMultiUserMode();
  void LoadPreferenceFunctions();

  platform::DeviceProperties& properties_;
  platform::FileSystem& files_;
  platform::LibraryLoader& libraries_;
  platform::SystemLog& log_;
  std::once_flag internalOnce_;
  bool internal_ = false;
  std::mutex homeMutex_;  // over the two that follow
  std::optional<bool> multiUser_;
  std::optional<std::string> home_;
  platform::QNSPreferencesGetIntegerValueFunction* readInteger_ = nullptr;
  platform::QNSPreferencesSetValueFunction* writeValue_ = nullptr;
};

}  // namespace morvend
