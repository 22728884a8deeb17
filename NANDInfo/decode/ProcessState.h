// What the library keeps for the life of the process. Programs that use the library can't reach it.
#pragma once

#include <string>

namespace NANDInfo {

// While it lives, the library's first error message is this object's own, from none on; afterwards
// it is again what it was. For what isn't asked of a controller (a buffer is tried as something),
// and for tests, which are many processes in one. One lies within another or after it.
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

// Sets the table of controller drivers to its first state.
void ResetExporters();

}  // namespace NANDInfo
