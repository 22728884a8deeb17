// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Libraries that are loaded at run time.
#pragma once

#include <string_view>

namespace platform {

class LibraryLoader {
 public:
  virtual ~LibraryLoader() = default;

  // Loads the library at an absolute path of the device, lazily bound and local; null when it can't
  // be loaded. It stays loaded for the life of the process.
  virtual void* load(std::string_view path) = 0;

  // A symbol's address, or null.
  virtual void* symbol(void* library, const char* name) = 0;
};

}  // namespace platform
