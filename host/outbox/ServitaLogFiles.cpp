#include "host/outbox/ServitaLogFiles.h"

#include <cerrno>

#include "host/files/Files.h"

namespace host {

namespace {

constexpr char kFolder[] = "/var/log/servita";
constexpr std::string_view kSuffix = ".log";
constexpr int kOldest = 7;

}  // namespace

void ServitaLogFiles::rollServitaLogs() {
  const auto report = [this](const std::string& name, const char* why) {
    log_.log(platform::LogLevel::error, "Could not roll %s: %s",
             root_.hostPath(kFolder, name).c_str(), why);
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
    const RolledOver rolled = rollOver(folder.get(), log, kOldest);
    if (rolled.error != 0) report(rolled.at, errorText(rolled.error));
    if (rolled.error != 0) continue;
    for (const std::string& name : rolled.inTheWay) report(name, errorText(EINVAL));
  }
}

}  // namespace host
