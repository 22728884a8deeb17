#include "platform/host/StructuredLogFiles.h"

#include <fcntl.h>
#include <sys/stat.h>

#include <cerrno>
#include <optional>

#include "platform/host/FileTime.h"
#include "platform/host/Files.h"
#include "platform/host/JSON.h"
#include "platform/host/SpoolFolder.h"

namespace platform::host {

namespace {

constexpr char kFolder[] = "/var/spool/morvend/structured";
constexpr std::string_view kSuffix = ".jsonl";

// 0 or an error number.
int moveToSpool(int folder, const std::string& name, SpoolFolder& spool) {
  struct stat status;
  if (::fstatat(folder, name.c_str(), &status, AT_SYMLINK_NOFOLLOW) != 0) return errno;
  if (!S_ISREG(status.st_mode)) return EINVAL;
  if (spool.error() != 0) return spool.error();
  const std::string stem = "structured-" + name.substr(0, name.size() - kSuffix.size());
  return spool.place(stem, std::string(kSuffix), static_cast<std::uint64_t>(status.st_size),
                     [&](const std::string& to) {
                       const int error = renameToFreeName(folder, name, spool.descriptor(), to);
                       if (error != 0) return error;
                       const bool kept = ::fsync(spool.descriptor()) == 0 && ::fsync(folder) == 0;
                       return kept ? 0 : errno;
                     });
}

}  // namespace

void StructuredLogFiles::logStructuredData(std::int32_t type, const Dictionary& data) {
  const Date now = clock_.now();
  std::string line;
  appendJSON(line, Dictionary{{"type", type}, {"time", now}, {"data", data}});
  line += '\n';
  const std::string name = fileDay(now.secondsSince1970).append(kSuffix);
  const FileDescriptor folder = root_.openFolder(kFolder, DeviceRoot::Missing::create);
  const int error = folder ? appendLines(folder.get(), name, line) : errno;
  if (error != 0) {
    log_.log(LogLevel::error, "Could not write %s/%s: %s", kFolder, name.c_str(), errorText(error));
  }
}

void StructuredLogFiles::dumpAllOldStructuredDataLogs() {
  const FileDescriptor folder = root_.openFolder(kFolder, DeviceRoot::Missing::fails);
  if (!folder && errno == ENOENT) return;
  std::vector<std::string> names;
  if (const int error = folder ? namesInFolder(folder.get(), names) : errno) {
    log_.log(LogLevel::error, "Could not read %s: %s", kFolder, errorText(error));
  }
  const std::string today = fileDay(clock_.now().secondsSince1970);
  std::optional<SpoolFolder> spool;  // opened and locked by the first file
  for (const std::string& name : names) {
    if (!name.ends_with(kSuffix)) continue;
    const std::string_view day = std::string_view(name).substr(0, name.size() - kSuffix.size());
    if (!isFileDay(day) || day >= today) continue;
    if (!spool) spool.emplace(root_, log_);
    if (const int error = moveToSpool(folder.get(), name, *spool)) {
      log_.log(LogLevel::error, "Could not move %s/%s to %s: %s", kFolder, name.c_str(),
               SpoolFolder::kPath, errorText(error));
    }
  }
}

}  // namespace platform::host
