// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The library's first error message, for one part of the process's life. Programs that use the
// library can't reach it.
#pragma once

#include <string>

namespace NANDInfo {

// While it lives, the first error message is this object's own, from none on; afterwards it is
// again what it was. For tests, which are many processes in one. One lies within another or after
// it.
class APIErrorScope {
 public:
  APIErrorScope();
  ~APIErrorScope();
  APIErrorScope(const APIErrorScope&) = delete;
  APIErrorScope& operator=(const APIErrorScope&) = delete;

 private:
  std::string outer_;
  bool outerRecorded_;
};

}  // namespace NANDInfo
