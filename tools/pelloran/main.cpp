// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The process of the command pelloran.

#include <unistd.h>

#include <iostream>
#include <thread>

#include "host/Host.h"
#include "host/process/Surroundings.h"
#include "tools/common/CommandLog.h"
#include "tools/common/StandardOutput.h"
#include "tools/pelloran/Pelloran.h"

namespace {

int run(std::ostream& out, int argc, char** argv) {
  tools::CommandLog log("pelloran");
  host::Host host(log.hostOptions());
  return pelloran::runPelloran(
      {.store = host.counters(),
       .clock = host.services().clock,
       .in = std::cin,
       .out = out,
       .err = std::cerr,
       .errIsTerminal = ::isatty(STDERR_FILENO) == 1,
       .figures = host::figures::readMachineFigures,
       .waitUntil = [](auto moment) { std::this_thread::sleep_until(moment); },
       .root = host.root().isThere()},
      argc, argv);
}

}  // namespace

int main(int argc, char** argv) {
  host::settleIn();
  tools::StandardOutput out;
  return out.end(run(out, argc, argv));
}
