// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The library's first error message, for one part of a thread's life. Programs that use the library
// can't reach it.
#pragma once

namespace NANDInfo {

struct APIErrorChannel {
  char message[1024];
  bool recorded = false;
};

// While it lives, the first error message is, for this thread, the object's own, from none on;
// afterwards it is again what it was. For calls that don't share it, and for tests, which are many
// processes in one. One lies within another or after it.
class APIErrorScope {
 public:
  APIErrorScope();
  ~APIErrorScope();
  APIErrorScope(const APIErrorScope&) = delete;
  APIErrorScope& operator=(const APIErrorScope&) = delete;

 private:
  APIErrorChannel own_;
  APIErrorChannel* outer_;
};

}  // namespace NANDInfo
