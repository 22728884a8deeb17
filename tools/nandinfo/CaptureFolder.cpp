// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/nandinfo/CaptureFolder.h"

#include <system_error>

#include <fcntl.h>
#include <sys/stat.h>

#include "host/files/Files.h"
#include "host/files/SystemError.h"

namespace nandinfo {

base::Result<void> CaptureFolder::open(const std::string& path) {
  path_ = path;
  const auto made = host::checked(::mkdir(path.c_str(), 0700));
  made_ = static_cast<bool>(made);
  if (!made && !made.error().is(std::errc::file_exists)) return made.error().at(path);
  auto folder = host::opened(::open(path.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
  if (!folder) return folder.error().at(path);
  folder_ = *std::move(folder);
  const auto names = host::namesInFolder(folder_.get());
  if (!names) return names.error().at(path);
  if (!names->empty()) return base::Error{"the folder is not empty"}.at(path);
  return {};
}

base::Result<void> CaptureFolder::write(const std::string& name, std::string_view bytes) {
  files_.push_back(name);  // a failure may come after the file got its name
  return host::replaceFile(folder_.get(), name, bytes).at(path_ + "/" + name);
}

CaptureFolder::~CaptureFolder() {
  if (finished_) return;
  for (const std::string& file : files_) ::unlinkat(folder_.get(), file.c_str(), 0);
  if (made_) ::rmdir(path_.c_str());
}

}  // namespace nandinfo
