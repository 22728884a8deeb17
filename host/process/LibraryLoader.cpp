// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/process/LibraryLoader.h"

#include <string_view>

#include <dlfcn.h>
#include <sys/stat.h>

namespace host {

void* LibraryLoader::load(std::string_view path) {
  if (const auto loaded = libraries_.find(path); loaded != libraries_.end()) {
    return loaded->second.handle;
  }
  auto file = root_.openForReading(path);
  struct stat status;
  if (!file || ::fstat(file->get(), &status) != 0 || !S_ISREG(status.st_mode)) return nullptr;
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
