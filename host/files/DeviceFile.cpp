#include "host/files/DeviceFile.h"

#include <cerrno>
#include <cstring>

#include "host/files/Files.h"
#include "plist/PropertyList.h"

namespace host {

const plist::Value* DeviceFile::value() {
  std::call_once(once_, [this] { value_ = load(); });
  return value_ ? &*value_ : nullptr;
}

std::optional<plist::Value> DeviceFile::load() const {
  const FileDescriptor file = root_.openForReading(path_);
  if (!file) {
    // EBADF: there is no root.
    if (errno != ENOENT && errno != ENOTDIR && errno != EBADF) {
      log_.log(platform::LogLevel::error, "%s: %s", root_.hostPath(path_).c_str(),
               std::strerror(errno));
    }
    return std::nullopt;
  }
  // One byte more, for the codec to see that the file is too long.
  auto content = readRegularFile(file.get(), plist::kMaxSize + 1).and_then(plist::read);
  if (!content)
    log_.log(platform::LogLevel::error, "%s: %s", root_.hostPath(path_).c_str(),
             content.error().text.c_str());
  return std::move(content).orNone();
}

}  // namespace host
