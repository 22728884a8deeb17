// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// A property list below device/: what the device itself answers for one of its services.
#pragma once

#include <mutex>
#include <optional>
#include <string>

#include "host/files/DeviceRoot.h"
#include "platform/SystemLog.h"
#include "plist/PropertyList.h"
#include "plist/Value.h"

namespace host {

// The file is read by the first call and never again; calls may come from any thread. A file that
// can't be read or parsed, or that has no room beside the others in what a root's may fill
// together, is said once, with an error line, and counts as missing.
class DeviceFile {
 public:
  // `path` as in "device/kernel.plist".
  DeviceFile(const DeviceRoot& root, platform::SystemLog& log, std::string path)
      : root_(root), log_(log), path_(std::move(path)) {}

  // The top level, whatever its type; null when there is no file.
  const plist::Value* value();

  // The top level if it has the type asked for; null when there is no file or it has another type.
  const plist::Dictionary* dictionary() { return contentAs<plist::Dictionary>(); }
  const plist::Array* array() { return contentAs<plist::Array>(); }

 private:
  std::optional<plist::Value> load() const;
  template <typename Type>
  const Type* contentAs() {
    const plist::Value* content = value();
    return content != nullptr ? content->as<Type>() : nullptr;
  }

  const DeviceRoot& root_;
  platform::SystemLog& log_;
  std::string path_;
  std::once_flag once_;
  std::optional<plist::Value> value_;
};

}  // namespace host
