// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The process of the command nandinfo.

#include <unistd.h>

#include <iostream>

#include "host/process/Surroundings.h"
#include "tools/common/StandardOutput.h"
#include "tools/common/Terminal.h"
#include "tools/nandinfo/NandinfoCommand.h"
#include "tools/recorder/RecordDrives.h"

namespace {

// The drives of this machine, for which no recorded device stands.
base::Result<nandinfo::RecordedDrives> record(const host::DeviceRoot& root) {
  if (root.isRecorded()) return base::Error{root.path() + " is a recorded device"};
  return recorder::recordDrives(host::DeviceRoot(host::HostOptions().machineFiles));
}

int run(std::ostream& out, int argc, char** argv) {
  tools::CommandLog log("nandinfo");
  host::Host host(log.hostOptions());
  const nandinfo::CommandServices services{.storage = host.services(),
                                           .out = out,
                                           .err = std::cerr,
                                           .outIsTerminal = ::isatty(STDOUT_FILENO) == 1,
                                           .errIsTerminal = ::isatty(STDERR_FILENO) == 1,
                                           .width = tools::terminalWidth(),
                                           .root = host.root().isThere(),
                                           .log = &log,
                                           .recordDrives = [&host] { return record(host.root()); },
                                           .kept = [&host] { return host.kept(); },
                                           .runLock = &host.services().runLock};
  return nandinfo::runNandinfo(services, argc, argv);
}

}  // namespace

int main(int argc, char** argv) {
  host::settleIn();
  tools::StandardOutput out;
  return out.end(run(out, argc, argv));
}
