// The process of the command pelloran.

#include <unistd.h>

#include <iostream>
#include <thread>

#include "daemon/context/DeviceContext.h"
#include "platform/host/Host.h"
#include "tools/pelloran/Pelloran.h"

int main(int argc, char** argv) {
  platform::host::Host host;
  morvend::DeviceContext context(host.platform());
  host.keepCountersBelow([&context] { return context.GetHomeDirectoryPath(); });
  return pelloran::runPelloran(
      {.store = host.counters(),
       .clock = host.platform().clock,
       .in = std::cin,
       .out = std::cout,
       .err = std::cerr,
       .errIsTerminal = ::isatty(STDERR_FILENO) == 1,
       .figuresRoot = "/",
       .waitUntil = [](auto moment) { std::this_thread::sleep_until(moment); }},
      argc, argv);
}
