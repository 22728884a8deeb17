// The process of the command nandinfo.

#include <sys/ioctl.h>
#include <unistd.h>

#include <iostream>

#include "platform/host/Host.h"
#include "tools/nandinfo/NandinfoCommand.h"

int main(int argc, char** argv) {
  platform::host::Host host;
  nandinfo::CommandServices services{.platform = host.platform(),
                                     .out = std::cout,
                                     .err = std::cerr,
                                     .outIsTerminal = ::isatty(STDOUT_FILENO) == 1,
                                     .errIsTerminal = ::isatty(STDERR_FILENO) == 1};
  if (!host.root().openForStatus("/")) services.missingRoot = host.root().path();
  winsize size{};
  if (services.outIsTerminal && ::ioctl(STDOUT_FILENO, TIOCGWINSZ, &size) == 0 && size.ws_col > 0) {
    services.width = size.ws_col;
  }
  return nandinfo::runNandinfo(services, argc, argv);
}
