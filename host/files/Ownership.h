// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Whose a new file is. Who runs as root on the device root of another user must leave nothing there
// that this user can't write to.
#pragma once

#include <sys/types.h>

namespace host {

// While it lives, what this thread makes belongs to the owner of an open folder, from its first
// moment on, and is made with no more rights than that user's. It does nothing unless this process
// is root and the folder somebody else's. Every call that makes a file or a folder stands in
// the scope of one: see makeFile and makeFolder.
class AsOwnerOf {
 public:
  explicit AsOwnerOf(int folder);
  ~AsOwnerOf();
  AsOwnerOf(const AsOwnerOf&) = delete;
  AsOwnerOf& operator=(const AsOwnerOf&) = delete;

 private:
  bool another_ = false;
  gid_t group_ = 0;  // root's own
};

}  // namespace host
