// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Libraries of the device, loaded into this process. A device root may be anybody's: it runs no
// code here but what is installed with this program, unless this root is said to be trusted.
#pragma once

#include <functional>
#include <map>
#include <string>

#include "base/Result.h"
#include "host/files/DeviceRoot.h"
#include "host/files/FileDescriptor.h"
#include "platform/LibraryLoader.h"
#include "platform/PreferenceStore.h"
#include "platform/SystemLog.h"

namespace host {

// Where the module that device roots carry is: in the folder lib beside the one that this program
// stands in, as the build has it, or installed in morvend/ below that.
base::Result<std::string> installedModule();

class LibraryLoader : public platform::LibraryLoader {
 public:
  enum class Trusted { installed, root };

  // The store is what the crash-reporting support library acts on; all are borrowed.
  LibraryLoader(const DeviceRoot& root, platform::PreferenceStore& preferences,
                platform::SystemLog& log, Trusted trusted)
      : root_(root), preferences_(preferences), log_(log), trusted_(trusted) {}

  // The path is resolved below the root like every other: a link to a file outside of it leads
  // nowhere, so that a root carries its libraries as files (copies or hard links) or links within.
  // Unless the root is trusted, what is loaded is the installed module, and only where the root's
  // file is the same byte for byte; any other is not loaded, with an error line.
  // This machine needs no such file: where it has none, its crash-reporting support library is the
  // installed module.
  // A library that has "FaultwatchSupportUsePreferences" is given the preference store.
  void* load(std::string_view path) override;
  void* symbol(void* library, const char* name) override;

 private:
  struct Library {
    FileDescriptor file;
    void* handle;
  };

  base::Result<FileDescriptor> installedInstead(const FileDescriptor& file) const;

  const DeviceRoot& root_;
  platform::PreferenceStore& preferences_;
  platform::SystemLog& log_;
  const Trusted trusted_;
  std::map<std::string, Library, std::less<>> libraries_;  // by path; stay loaded
};

}  // namespace host
