// Probes that tell what kind of device this is and where its counters data lie.
//
// What doesn't change during the life of the process is asked once and kept here.
// PLIsInternalDevice and GetHomeDirectoryPath may be called from several threads; the others belong
// to the main thread.
#pragma once

#include <cstdint>
#include <mutex>
#include <optional>
#include <string>

#include "platform/Platform.h"

namespace morvend {

class DeviceContext {
 public:
  explicit DeviceContext(platform::Platform& platform) : platform_(platform) {}
  DeviceContext(const DeviceContext&) = delete;
  DeviceContext& operator=(const DeviceContext&) = delete;

  // Whether this is an internal (development) build: the device property "InternalBuild".
  bool PLIsInternalDevice();

  // The home directory of the counters data, as a device path: "/var/mobile", or the system group
  // container of the analytics service on a multi-user device. Null when that container can't be
  // had; it is then asked for again at the next call. The text is borrowed and stays valid.
  const std::string* GetHomeDirectoryPath();

  // The size of the counters database in whole MiB, or -1 when it can't be examined.
  std::int64_t GetCountersDatabaseSizeMB();

  // How often the counters database was found corrupt since the last call: the preference
  // "DatabaseCorruptionCount" of "com.norba.pellorand", read and set to 0. 0, and nothing is
  // changed, when the preference functions can't be loaded.
  std::int64_t ReadAndResetDatabaseCorruptionCount();

 private:
  bool determineMultiUserMode();
  void LoadPreferenceFunctions();

  platform::Platform& platform_;
  std::once_flag internalOnce_;
  bool internal_ = false;
  std::mutex homeMutex_;  // over the two that follow
  std::optional<bool> multiUser_;
  std::optional<std::string> home_;
  platform::QNSPreferencesGetIntegerValueFunction* readInteger_ = nullptr;
  platform::QNSPreferencesSetValueFunction* writeValue_ = nullptr;
};

}  // namespace morvend
