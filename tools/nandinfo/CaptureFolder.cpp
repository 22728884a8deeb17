#include "tools/nandinfo/CaptureFolder.h"

#include <fcntl.h>
#include <sys/stat.h>

#include <cerrno>
#include <cstring>

#include "host/files/Files.h"

namespace nandinfo {

std::string CaptureFolder::open(const std::string& path) {
  path_ = path;
  made_ = ::mkdir(path.c_str(), 0700) == 0;
  if (!made_ && errno != EEXIST) return path + ": " + std::strerror(errno);
  folder_ = host::FileDescriptor(::open(path.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
  if (!folder_) return path + ": " + std::strerror(errno);
  std::vector<std::string> names;
  if (const int error = host::namesInFolder(folder_.get(), names)) {
    return path + ": " + std::strerror(error);
  }
  return names.empty() ? "" : path + ": the folder is not empty";
}

std::string CaptureFolder::write(const std::string& name, std::string_view bytes) {
  files_.push_back(name);  // a failure may come after the file got its name
  const int error = host::replaceFile(folder_.get(), name, bytes);
  return error == 0 ? "" : path_ + "/" + name + ": " + host::errorText(error);
}

CaptureFolder::~CaptureFolder() {
  if (finished_) return;
  for (const std::string& file : files_) ::unlinkat(folder_.get(), file.c_str(), 0);
  if (made_) ::rmdir(path_.c_str());
}

}  // namespace nandinfo
