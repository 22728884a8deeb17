// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The folder that a capture fills. What was written is taken back unless the capture is finished.
#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "base/Result.h"
#include "host/files/FileDescriptor.h"

namespace nandinfo {

class CaptureFolder {
 public:
  ~CaptureFolder();

  // Opens the folder: an empty one, or one that is made, with mode 0700.
  base::Result<void> open(const std::string& path);

  // Writes a file whole, with mode 0600.
  base::Result<void> write(const std::string& name, std::string_view bytes);

  // The files stay.
  void finish() { finished_ = true; }

 private:
  std::string path_;
  host::FileDescriptor folder_;
  bool made_ = false, finished_ = false;
  std::vector<std::string> files_;
};

}  // namespace nandinfo
