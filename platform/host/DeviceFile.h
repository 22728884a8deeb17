// A property list below device/: what the device itself answers for one of its services.
#pragma once

#include <mutex>
#include <optional>
#include <string>

#include "platform/PropertyList.h"
#include "platform/PropertyListCodec.h"
#include "platform/SystemLog.h"
#include "platform/host/DeviceRoot.h"

namespace platform::host {

// The file is read by the first call and never again; calls may come from any thread. A file that
// can't be read or parsed is said once, with an error line, and counts as missing.
class DeviceFile {
 public:
  // `path` as in "device/kernel.plist".
  DeviceFile(const DeviceRoot& root, PropertyListCodec& codec, SystemLog& log, std::string path)
      : root_(root), codec_(codec), log_(log), path_(std::move(path)) {}

  // The top level, whatever its type; null when there is no file.
  const Value* value();

  // The top level if it has the type asked for; null when there is no file or it has another type.
  const Dictionary* dictionary() { return contentAs<Dictionary>(); }
  const Array* array() { return contentAs<Array>(); }

 private:
  std::optional<Value> load() const;
  template <typename Type>
  const Type* contentAs() {
    const Value* content = value();
    return content != nullptr ? content->as<Type>() : nullptr;
  }

  const DeviceRoot& root_;
  PropertyListCodec& codec_;
  SystemLog& log_;
  std::string path_;
  std::once_flag once_;
  std::optional<Value> value_;
};

}  // namespace platform::host
