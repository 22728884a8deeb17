// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/files/DeviceFile.h"

#include <system_error>

#include "host/files/SystemError.h"
#include "plist/PropertyList.h"

namespace host {

const plist::Value* DeviceFile::value() {
  std::call_once(once_, [this] { value_ = load(); });
  return value_ ? &*value_ : nullptr;
}

std::optional<plist::Value> DeviceFile::load() const {
  // One byte more, for the codec to see that the file is too long.
  auto content = root_.readFile(path_, plist::kMaxSize + 1)
                     .and_then(plist::read)
                     .and_then([this](plist::Value value) -> base::Result<plist::Value> {
                       if (root_.takeMemory(plist::memoryOf(value))) return value;
                       return base::Error{"the device's files hold too much together"};
                     });
  if (!content) {
    const base::Error& why = content.error();
    if (!isMissing(why) && !why.is(std::errc::not_a_directory)) {
      log_.log(platform::LogLevel::error, "%s", why.at(root_.hostPath(path_)).text.c_str());
    }
  }
  return std::move(content).orNone();
}

}  // namespace host
