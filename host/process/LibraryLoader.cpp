// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/process/LibraryLoader.h"

#include <dlfcn.h>
#include <fcntl.h>
#include <sys/stat.h>

#include <filesystem>
#include <string_view>
#include <system_error>
#include <utility>

#include "host/files/Files.h"
#include "host/files/SystemError.h"
#include "platform/FaultwatchSupport.h"

namespace host {

namespace {

constexpr std::size_t kMaxModule = std::size_t{64} << 20;

base::Result<FileDescriptor> openModule(const base::Result<std::string>& path) {
  if (!path) return path.error();
  return opened(::open(path->c_str(), O_RDONLY | O_CLOEXEC)).at(*path);
}

}  // namespace

base::Result<std::string> installedModule() {
  constexpr char kProgram[] = "/proc/self/exe";
  std::error_code error;
  const auto program = std::filesystem::read_symlink(kProgram, error);
  if (error) return systemError(error.value()).at(kProgram);
  const auto lib = program.parent_path().parent_path() / "lib";
  const auto installed = lib / "morvend" / "FaultwatchSupport.so";
  const bool isInstalled = std::filesystem::exists(installed, error);
  if (error) return systemError(error.value()).at(installed.string());
  return (isInstalled ? installed : lib / "FaultwatchSupport.so").string();
}

base::Result<FileDescriptor> LibraryLoader::installedInstead(const FileDescriptor& file) const {
  const auto path = installedModule();
  auto installed = openModule(path);
  if (!installed) return installed;
  struct stat theirs, ours;
  if (::fstat(file.get(), &theirs) != 0 || ::fstat(installed->get(), &ours) != 0) {
    return systemError();
  }
  bool same = theirs.st_size == ours.st_size;
  if (same) {
    const auto bytes = readRegularFile(file.get(), kMaxModule);
    if (!bytes) return bytes.error();
    const auto expected = readRegularFile(installed->get(), kMaxModule);
    if (!expected) return expected.error().at(*path);
    same = *bytes == *expected;
  }
  if (!same) return base::Error{"it is not the installed module, " + *path};
  return installed;
}

void* LibraryLoader::load(std::string_view path) {
  if (const auto loaded = libraries_.find(path); loaded != libraries_.end()) {
    return loaded->second.handle;
  }
  auto file = root_.openForReading(path);
  const bool isInstalled = !file && path == platform::kFaultwatchSupportPath && !root_.isRecorded();
  if (isInstalled) file = root_.patience()([] { return openModule(installedModule()); });
  struct stat status;
  if (!file || !root_.patience()([&] { return checked(::fstat(file->get(), &status)); }) ||
      !S_ISREG(status.st_mode)) {
    return nullptr;
  }
  if (!isInstalled && trusted_ == Trusted::installed) {
    auto installed = root_.patience()([&] { return installedInstead(*file); });
    if (!installed) {
      log_.log(platform::LogLevel::error,
               "Not loading %s: %s; MORVEND_RUN_MODULES=1 would say that this root is trusted",
               root_.hostPath(path).c_str(), installed.error().text.c_str());
      return nullptr;
    }
    file = std::move(installed);
  }
  // The file stays open, because the dynamic linker knows the library under this name from now on.
  const std::string name = "/proc/self/fd/" + std::to_string(file->get());
  void* library = ::dlopen(name.c_str(), RTLD_LAZY | RTLD_LOCAL);
  if (library == nullptr) return nullptr;
  using UsePreferences = void(platform::PreferenceStore*);
  if (auto* use =
          reinterpret_cast<UsePreferences*>(symbol(library, "FaultwatchSupportUsePreferences"))) {
    use(&preferences_);
  }
  libraries_.emplace(path, Library{*std::move(file), library});
  return library;
}

void* LibraryLoader::symbol(void* library, const char* name) { return ::dlsym(library, name); }

}  // namespace host
