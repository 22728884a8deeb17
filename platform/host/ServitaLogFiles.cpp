#include "platform/host/ServitaLogFiles.h"

#include <fcntl.h>
#include <sys/stat.h>

#include <algorithm>
#include <cerrno>
#include <cstdio>

#include "platform/host/Files.h"

namespace platform::host {

namespace {

constexpr char kFolder[] = "/var/log/servita";
constexpr std::string_view kSuffix = ".log";
constexpr int kOldest = 7;

// The file with a number; 0 is the current one.
std::string numbered(const std::string& log, int number) {
  return number == 0 ? log : log + "." + std::to_string(number);
}

// 0 or an error number, with `name` the file that it is about.
int roll(int folder, const std::string& log, std::string& name) {
  // Up to the first number that is free; where none is, the oldest file makes room.
  int free = 0;
  for (; free <= kOldest; ++free) {
    name = numbered(log, free);
    struct stat status;
    if (::fstatat(folder, name.c_str(), &status, AT_SYMLINK_NOFOLLOW) != 0) {
      if (errno != ENOENT) return errno;
      break;
    }
    if (!S_ISREG(status.st_mode)) return EINVAL;
  }
  for (int number = std::min(free, kOldest) - 1; number >= 0; --number) {
    name = numbered(log, number);
    if (::renameat(folder, name.c_str(), folder, numbered(log, number + 1).c_str()) != 0) {
      return errno;
    }
  }
  return 0;
}

}  // namespace

void ServitaLogFiles::rollServitaLogs() {
  const auto report = [this](const std::string& name, const char* why) {
    log_.log(LogLevel::error, "Could not roll %s%s%s: %s", kFolder, name.empty() ? "" : "/",
             shownText(name).c_str(), why);
  };
  const FileDescriptor folder = root_.openFolder(kFolder, DeviceRoot::Missing::fails);
  if (!folder) {
    if (errno != ENOENT) report("", errorText(errno));
    return;
  }
  const FileLock lock(folder.get());
  std::vector<std::string> names;
  if (const int error = namesInFolder(folder.get(), names)) report("", errorText(error));
  for (const std::string& log : names) {
    if (log.size() <= kSuffix.size() || !log.ends_with(kSuffix)) continue;
    std::string name;
    if (const int error = roll(folder.get(), log, name)) report(name, errorText(error));
  }
}

}  // namespace platform::host
