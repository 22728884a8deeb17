// morvend: turns the device's counters into its daily report, and exits.

#include <memory>
#include <string>

#include "daemon/Entry.h"
#include "platform/host/Host.h"

int main(int argc, char** argv) {
  platform::host::Host host;
  if (const std::string problem = host.root().problem(); !problem.empty()) {
    // Said, and then a run like any other on a device that has nothing.
    host.platform().log.log(platform::LogLevel::error, "%s", problem.c_str());
  }
  // The host's too: it may record what comes in late, up to its end.
  const auto context = std::make_shared<morvend::DeviceContext>(host.platform());
  host.keepCountersBelow([context] { return context->GetHomeDirectoryPath(); });
  morvend::RunProcess(host.platform(), *context, argc, argv);
  return 0;
}
