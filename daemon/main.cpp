// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// morvend: turns the device's counters into its daily report, and exits.

#include "base/Result.h"
#include "daemon/Entry.h"
#include "host/Host.h"
#include "host/process/EndSignals.h"
#include "host/process/StandardErrorLog.h"
#include "host/process/Surroundings.h"
#include "platform/SystemLog.h"

namespace {

using platform::LogLevel;

// Whether all of the day is kept.
base::Result<void> run(const host::HostOptions& options, int argc, char** argv) {
  host::Host host(options);
  if (const auto root = host.root().isThere(); !root) {
    // Said, and then a run like any other on a device that has nothing.
    host.services().log.log(LogLevel::error, "%s", root.error().text.c_str());
  }
  morvend::RunProcess(host.services(), host.context(), argc, argv);
  return host.kept();
}

}  // namespace

int main(int argc, char** argv) {
  host::settleIn();
  host::deferEndSignals();  // a day's work that has begun is finished
  auto options = host::HostOptions::fromEnvironment();
  host::StandardErrorLog log(options.lowestLevel);
  options.standardError = &log;
  // The last line, after all that the host says at its end: the exit status doesn't tell.
  if (const auto kept = run(options, argc, argv); !kept) {
    log.log(LogLevel::error, "the day is not done: %s", kept.error().text.c_str());
  }
  return 0;
}
