// The process of the command nandinfo.

#include <unistd.h>

#include <iostream>

#include "platform/host/Host.h"
#include "tools/nandinfo/NandinfoCommand.h"

int main(int argc, char** argv) {
  platform::host::Host host;
  return nandinfo::runNandinfo({.platform = host.platform(),
                                .out = std::cout,
                                .err = std::cerr,
                                .outIsTerminal = ::isatty(STDOUT_FILENO) == 1},
                               argc, argv);
}
