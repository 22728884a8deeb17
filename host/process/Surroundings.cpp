// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/process/Surroundings.h"

#include <fcntl.h>
#include <unistd.h>

#include <csignal>

namespace host {

void settleIn() {
  for (int stream = STDIN_FILENO; stream <= STDERR_FILENO; ++stream) {
    // The lowest number that is free is the one that is looked at.
    if (::fcntl(stream, F_GETFD) == -1) static_cast<void>(::open("/dev/null", O_RDWR));
  }
  std::signal(SIGXFSZ, SIG_IGN);
}

}  // namespace host
