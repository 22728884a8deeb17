#include "platform/host/DeviceFile.h"

#include <cerrno>
#include <cstring>

#include "platform/host/Files.h"

namespace platform::host {

const Value* DeviceFile::value() {
  std::call_once(once_, [this] { value_ = load(); });
  return value_ ? &*value_ : nullptr;
}

std::optional<Value> DeviceFile::load() const {
  const FileDescriptor file = root_.openForReading(path_);
  if (!file) {
    // EBADF: there is no root.
    if (errno != ENOENT && errno != ENOTDIR && errno != EBADF) {
      log_.log(LogLevel::error, "%s: %s", root_.hostPath(path_).c_str(), std::strerror(errno));
    }
    return std::nullopt;
  }
  // One byte more, for the codec to see that the file is too long.
  const Result<std::string> bytes = readRegularFile(file.get(), kMaximumPropertyListSize + 1);
  Result<Value> content = bytes ? codec_.read(*bytes) : Result<Value>::failure(bytes.error);
  if (!content)
    log_.log(LogLevel::error, "%s: %s", root_.hostPath(path_).c_str(), content.error.c_str());
  return std::move(content.value);
}

}  // namespace platform::host
