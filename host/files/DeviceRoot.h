// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The device root: the directory that stands for a device's file system.
//
// Every path of the device is resolved below it, ".." and links included, so that nothing outside
// is read or written: by the kernel where it offers that (openat2), else part by part. Links within
// the root are followed to what is read, and refused on the way to what is written. Paths are
// device paths, with or without a leading slash. Nothing here logs: failures come back, without the
// path, for the service that knows what they mean to its user.
#pragma once

#include <atomic>
#include <cstddef>
#include <string>
#include <string_view>

#include "base/Result.h"
#include "host/files/FileDescriptor.h"
#include "host/files/PathWalk.h"
#include "host/files/Patience.h"

namespace host {

class DeviceRoot {
 public:
  // `path` is a path of the host; a root that isn't there reads as an empty device. `pause` is how
  // the time passes before something is tried again.
  explicit DeviceRoot(std::string path, Patience::Pause pause = LockWait::sleepFor);

  const std::string& path() const { return path_; }

  // For what is done to files on the device; all that this class does has it already.
  Patience& patience() const { return patience_; }

  // Whether the root is a folder; the error is of its path, which is `what`.
  base::Result<void> isThere(const char* what = "the device root") const;

  // Whether this is a recorded device: a root with a folder device/. Any other root is this
  // machine. Looked up at each call.
  bool isRecorded() const;

  // A device path as a path of the host, for who is to find the file.
  std::string hostPath(std::string_view path) const;

  // The same of a file in a folder, or of the folder if the name is empty, for a line of the log.
  std::string hostPath(std::string_view folder, std::string_view name) const;

  // Opens a file for reading; links are followed, within the root. The file may be of any kind, and
  // opening never blocks.
  base::Result<FileDescriptor> openForReading(std::string_view path) const;

  // Opens a file of any kind for its status only: no right to read it is needed. Otherwise as
  // openForReading.
  base::Result<FileDescriptor> openForStatus(std::string_view path) const;

  // The bytes of a regular file, at most `maximum` of them.
  base::Result<std::string> readFile(std::string_view path, std::size_t maximum) const;

  // What all files below device/ may fill together while they are held in memory. Takes of it;
  // false: there isn't as much left.
  static constexpr std::size_t kMaxHeld = std::size_t{32} << 20;
  bool takeMemory(std::size_t bytes) const;

  // Opens a folder in which the host keeps files. `create` makes what is missing, with mode 0700,
  // but not the root itself. No link is followed (ELOOP), unless `followed` allows those that stay
  // within the root, as a system's own links from one of its folders to another do.
  enum class Missing { fails, create };
  using Links = host::Links;
  base::Result<FileDescriptor> openFolder(std::string_view path, Missing missing,
                                          Links links = Links::refused) const;

 private:
  base::Result<FileDescriptor> open(const std::string& path, int flags, Links links) const;
  base::Result<FileDescriptor> openOnce(const std::string& path, int flags, Links links) const;
  base::Result<FileDescriptor> make(const std::string& folder, int flags, Links links) const;

  std::string path_;
  mutable Patience patience_;
  base::Result<FileDescriptor> root_;
  mutable std::atomic<std::size_t> memoryLeft_ = kMaxHeld;
};

}  // namespace host
