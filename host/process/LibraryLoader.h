// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Libraries of the device, loaded into this process.
#pragma once

#include <functional>
#include <map>
#include <string>

#include "host/files/DeviceRoot.h"
#include "platform/LibraryLoader.h"
#include "platform/PreferenceStore.h"

namespace host {

class LibraryLoader : public platform::LibraryLoader {
 public:
  // The store is what the crash-reporting support library acts on; it outlives every use of it.
  LibraryLoader(const DeviceRoot& root, platform::PreferenceStore& preferences)
      : root_(root), preferences_(preferences) {}

  // The path is resolved below the root like every other: a link to a file outside of it leads
  // nowhere, so that a root carries its libraries as files (copies or hard links) or links within.
  // A library that has "FaultwatchSupportUsePreferences" is given the preference store.
  void* load(std::string_view path) override;
  void* symbol(void* library, const char* name) override;

 private:
  struct Library {
    FileDescriptor file;
    void* handle;
  };

  const DeviceRoot& root_;
  platform::PreferenceStore& preferences_;
  std::map<std::string, Library, std::less<>> libraries_;  // by path; stay loaded
};

}  // namespace host
