// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "device/DeviceContext.h"

#include "platform/FaultwatchSupport.h"
#include "platform/Names.h"

namespace morvend {

using platform::LogLevel;

namespace {

constexpr char kInternalBuild[] = "InternalBuild";
constexpr char kForceMultiUserMode[] = "/var/db/forceMultiUserMode";
constexpr char kSystemGroupContainer[] = "systemgroup.com.norba.quenset";
constexpr char kSingleUserHome[] = "/var/mobile";
constexpr char kDatabaseBelowHome[] = "/Library/Pelloran/PLDataStore.sqlitedb";
constexpr char kCorruptionCount[] = "DatabaseCorruptionCount";

}  // namespace

bool DeviceContext::PLIsInternalDevice() {
  std::call_once(internalOnce_, [&] { internal_ = properties_.booleanProperty(kInternalBuild); });
  return internal_;
}

// The property is read directly here, not through the flag that PLIsInternalDevice keeps.
bool DeviceContext::isForcedToMultiUserMode() {
  return properties_.booleanProperty(kInternalBuild) && files_.fileStatus(kForceMultiUserMode);
}

bool DeviceContext::isMultiUserDevice() {
  return properties_.multiUserIndicator().value_or(0) != 0;
}

bool DeviceContext::determineMultiUserMode() {
  if (isForcedToMultiUserMode()) {
    log_.log(LogLevel::standard, "Forcing Multi User Mode behavior due to the presence of %s",
             kForceMultiUserMode);
    return true;
  }
  return isMultiUserDevice();
}

std::optional<std::string> DeviceContext::homeOfCounters() {
  const std::scoped_lock lock(homeMutex_);
  if (home_) return home_;
  if (!(multiUser_ ? *multiUser_ : isForcedToMultiUserMode() || isMultiUserDevice())) {
    return kSingleUserHome;
  }
  return properties_.systemGroupContainerPath(kSystemGroupContainer).path;
}

const std::string* DeviceContext::GetHomeDirectoryPath() {
  const std::scoped_lock lock(homeMutex_);
  if (home_) return &*home_;
  if (!multiUser_) multiUser_ = determineMultiUserMode();
  if (*multiUser_) {
    auto container = properties_.systemGroupContainerPath(kSystemGroupContainer);
    if (!container.path) {
      log_.log(LogLevel::standard, "Error getting system group container: %llu",
               static_cast<unsigned long long>(container.error));
      return nullptr;
    }
    home_ = std::move(container.path);
  } else {
    home_ = kSingleUserHome;
  }
  return &*home_;
}

std::int64_t DeviceContext::GetCountersDatabaseSizeMB() {
  const std::string* home = GetHomeDirectoryPath();
  if (home == nullptr) return -1;
  const auto size = files_.fileStatus(*home + kDatabaseBelowHome);
  return size ? static_cast<std::int64_t>(*size / 1048576) : -1;
}

void DeviceContext::LoadPreferenceFunctions() {
  void* library = libraries_.load(platform::kFaultwatchSupportPath);
  if (library == nullptr) {
    log_.log(LogLevel::error, "Failed to dynamically load the FaultwatchSupport framework");
    return;
  }
  readInteger_ = reinterpret_cast<platform::QNSPreferencesGetIntegerValueFunction*>(
      libraries_.symbol(library, "QNSPreferencesGetIntegerValue"));
  if (readInteger_ == nullptr) {
    // The spelling is the one that log readers look for.
    log_.log(LogLevel::error, "Failed to dyanmically link QNSPreferencesGetIntegerValue");
  }
  writeValue_ = reinterpret_cast<platform::QNSPreferencesSetValueFunction*>(
      libraries_.symbol(library, "QNSPreferencesSetValue"));
  if (writeValue_ == nullptr) {
    log_.log(LogLevel::error, "Failed to dynamically link QNSPreferencesSetValue");
  }
}

std::int64_t DeviceContext::ReadAndResetDatabaseCorruptionCount() {
  if (readInteger_ == nullptr || writeValue_ == nullptr) LoadPreferenceFunctions();
  if (readInteger_ == nullptr || writeValue_ == nullptr) return 0;
  const std::int64_t count = readInteger_(kCorruptionCount, platform::kPellorandDomain, nullptr);
  const plist::Value zero(0);
  writeValue_(kCorruptionCount, &zero, platform::kPellorandDomain);
  return count;
}

}  // namespace morvend
