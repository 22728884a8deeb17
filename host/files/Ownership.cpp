// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/files/Ownership.h"

#include <sys/fsuid.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>

namespace host {

AsOwnerOf::AsOwnerOf(int folder) {
  struct stat status;
  if (::geteuid() != 0 || ::fstat(folder, &status) != 0 || status.st_uid == 0) return;
  another_ = true;
  group_ = static_cast<gid_t>(::setfsgid(status.st_gid));
  ::setfsuid(status.st_uid);
}

AsOwnerOf::~AsOwnerOf() {
  if (!another_) return;
  const int error = errno;  // is the call's that stands after this object
  ::setfsuid(0);
  ::setfsgid(group_);
  errno = error;
}

}  // namespace host
