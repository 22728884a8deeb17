#include "platform/host/HostStandardStreams.h"

#include <unistd.h>

#include <string>

#include "platform/host/Files.h"

namespace platform::host {

void HostStandardStreams::writeError(std::string_view text) {
  std::string line(text);
  if (!line.ends_with('\n')) line += '\n';
  writeAll(STDERR_FILENO, line);
}

void HostStandardStreams::writeOutput(std::string_view text) { writeAll(STDOUT_FILENO, text); }

}  // namespace platform::host
