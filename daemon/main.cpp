// morvend: turns the device's counters into its daily report, and exits.

#include <string>

#include "daemon/Entry.h"
#include "host/Host.h"
#include "host/process/EndSignals.h"
#include "host/process/StandardErrorLog.h"
#include "platform/SystemLog.h"

namespace {

using platform::LogLevel;

// Returns what of the day couldn't be kept, or the empty text.
std::string run(const host::HostOptions& options, int argc, char** argv) {
  host::Host host(options);
  if (const std::string problem = host.root().problem(); !problem.empty()) {
    // Said, and then a run like any other on a device that has nothing.
    host.services().log.log(LogLevel::error, "%s", problem.c_str());
  }
  morvend::RunProcess(host.services(), host.context(), argc, argv);
  return host.unkept();
}

}  // namespace

int main(int argc, char** argv) {
  host::deferEndSignals();  // a day's work that has begun is finished
  auto options = host::HostOptions::fromEnvironment();
  host::StandardErrorLog log(options.lowestLevel);
  options.log = &log;
  // The last line, after all that the host says at its end: the exit status doesn't tell.
  if (const std::string unkept = run(options, argc, argv); !unkept.empty()) {
    log.log(LogLevel::error, "the day is not done: %s", unkept.c_str());
  }
  return 0;
}
