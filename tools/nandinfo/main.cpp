// The process of the command nandinfo.

#include <sys/ioctl.h>
#include <unistd.h>

#include <iostream>

#include "tools/common/StandardOutput.h"
#include "tools/nandinfo/NandinfoCommand.h"

namespace {

int run(std::ostream& out, int argc, char** argv) {
  tools::CommandLog log("nandinfo");
  host::Host host(log.hostOptions());
  nandinfo::CommandServices services{.storage = host.services(),
                                     .out = out,
                                     .err = std::cerr,
                                     .outIsTerminal = ::isatty(STDOUT_FILENO) == 1,
                                     .errIsTerminal = ::isatty(STDERR_FILENO) == 1,
                                     .rootProblem = host.root().problem(),
                                     .log = &log};
  winsize size{};
  if (services.outIsTerminal && ::ioctl(STDOUT_FILENO, TIOCGWINSZ, &size) == 0 && size.ws_col > 0) {
    services.width = size.ws_col;
  }
  return nandinfo::runNandinfo(services, argc, argv);
}

}  // namespace

int main(int argc, char** argv) {
  tools::StandardOutput out;
  return out.end(run(out, argc, argv));
}
