#include "platform/host/DeviceFileSystem.h"

#include <sys/stat.h>
#include <sys/statvfs.h>

namespace platform::host {

std::optional<std::uint64_t> DeviceFileSystem::fileStatus(std::string_view path) {
  const FileDescriptor file = root_.openForStatus(path);
  struct stat status;
  if (!file || ::fstat(file.get(), &status) != 0) return std::nullopt;
  return static_cast<std::uint64_t>(status.st_size);
}

std::optional<FileSystem::Statistics> DeviceFileSystem::statfs(std::string_view path) {
  const FileDescriptor file = root_.openForStatus(path);
  struct statvfs status;
  if (!file || ::fstatvfs(file.get(), &status) != 0) return std::nullopt;
  return Statistics{status.f_frsize, status.f_blocks, status.f_bavail};
}

std::optional<std::string> DeviceFileSystem::readFile(std::string_view path, std::size_t maximum) {
  return root_.readFile(path, maximum).value;
}

}  // namespace platform::host
