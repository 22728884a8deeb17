// The command nandinfo: calls the storage library and prints what it returns.
#pragma once

#include <ostream>

#include "platform/Platform.h"

namespace nandinfo {

struct CommandServices {
  platform::Platform& platform;
  std::ostream& out;
  std::ostream& err;
  bool outIsTerminal;
};

// Runs the command line; returns the exit status: 0 done, 1 the work failed, 2 wrong usage.
int runNandinfo(const CommandServices& services, int argc, char** argv);

}  // namespace nandinfo
