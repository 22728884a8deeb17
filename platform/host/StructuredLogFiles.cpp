#include "platform/host/StructuredLogFiles.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <array>
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

// What is larger goes to the spool in parts, of whole lines as far as there are any.
constexpr off_t kLargestPart = off_t{16} << 20;

// Where the last part of a file begins: after a line feed if there is one in reach.
off_t lastPart(int file, off_t size) {
  off_t start = std::max<off_t>(size - kLargestPart, 0);
  std::array<char, 65536> block;
  for (off_t at = start; start > 0 && at < size - 1;) {
    const ssize_t got = ::pread(file, block.data(), block.size(), at);
    if (got <= 0) break;
    const std::string_view read(block.data(), static_cast<std::size_t>(got));
    if (const auto end = read.find('\n'); end != read.npos && at + off_t(end) + 1 < size) {
      return at + static_cast<off_t>(end) + 1;
    }
    at += got;
  }
  return start;
}

// 0 or an error number.
int copyPart(int from, off_t start, off_t end, int to) {
  std::array<char, 65536> block;
  while (start < end) {
    const auto wanted = static_cast<std::size_t>(std::min<off_t>(end - start, block.size()));
    const ssize_t got = ::pread(from, block.data(), wanted, start);
    if (got < 0) return errno;
    if (got == 0) return EIO;
    if (const int error = writeAll(to, {block.data(), static_cast<std::size_t>(got)})) return error;
    start += got;
  }
  return ::fsync(to) == 0 ? 0 : errno;
}

// Cuts the last part off a file and into the spool, until what is left is small enough to be moved;
// the last part first, so that a part is in the spool before it leaves the file. 0 or an error
// number.
int cutToSpool(int folder, const std::string& name, const std::string& stem, SpoolFolder& spool) {
  const FileDescriptor file(
      ::openat(folder, name.c_str(), O_RDWR | O_NOFOLLOW | O_NONBLOCK | O_NOCTTY | O_CLOEXEC));
  struct stat status;
  if (!file || ::fstat(file.get(), &status) != 0) return errno;
  for (off_t size = status.st_size; size > kLargestPart;) {
    const off_t start = lastPart(file.get(), size);
    const FileDescriptor part(::openat(spool.descriptor(), SpoolFolder::kUnfinishedLog,
                                       O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, 0600));
    int error = part ? copyPart(file.get(), start, size, part.get()) : errno;
    if (error == 0) {
      error = spool.place(stem, std::string(kSuffix), static_cast<std::uint64_t>(size - start),
                          [&](const std::string& to) {
                            return renameToFreeName(spool.descriptor(), SpoolFolder::kUnfinishedLog,
                                                    spool.descriptor(), to);
                          });
    }
    if (error == 0 && ::fsync(spool.descriptor()) != 0) error = errno;
    if (error == 0 && ::ftruncate(file.get(), start) != 0) error = errno;
    if (error != 0) {
      spool.remove(SpoolFolder::kUnfinishedLog);
      return error;
    }
    size = start;
  }
  return 0;
}

// 0 or an error number.
int moveToSpool(int folder, const std::string& name, SpoolFolder& spool, SystemLog& log) {
  struct stat status;
  if (::fstatat(folder, name.c_str(), &status, AT_SYMLINK_NOFOLLOW) != 0) return errno;
  if (!S_ISREG(status.st_mode)) return EINVAL;
  if (spool.error() != 0) return spool.error();
  const std::string stem = "structured-" + name.substr(0, name.size() - kSuffix.size());
  if (status.st_size > kLargestPart) {
    log.log(LogLevel::standard, "%s/%s has %lld bytes: it is cut into parts", kFolder, name.c_str(),
            static_cast<long long>(status.st_size));
    if (const int error = cutToSpool(folder, name, stem, spool)) return error;
    if (::fstatat(folder, name.c_str(), &status, AT_SYMLINK_NOFOLLOW) != 0) return errno;
  }
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
    if (const int error = moveToSpool(folder.get(), name, *spool, log_)) {
      log_.log(LogLevel::error, "Could not move %s/%s to %s: %s", kFolder, name.c_str(),
               SpoolFolder::kPath, errorText(error));
    }
  }
}

}  // namespace platform::host
