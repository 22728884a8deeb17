// morvend: turns the device's counters into its daily report, and exits.

#include "daemon/Entry.h"
#include "platform/host/Host.h"

int main(int argc, char** argv) {
  platform::host::Host host;
  morvend::DeviceContext context(host.platform());
  host.keepCountersBelow([&context] { return context.GetHomeDirectoryPath(); });
  morvend::RunProcess(host.platform(), context, argc, argv);
  return 0;
}
