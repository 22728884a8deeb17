// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/process/StandardStreams.h"

#include <unistd.h>

#include <string>
#include <tuple>

#include "host/files/Files.h"

namespace host {

void StandardStreams::writeError(std::string_view text) {
  std::string line(text);
  if (!line.ends_with('\n')) line += '\n';
  std::ignore = writeAll(STDERR_FILENO, line);
}

void StandardStreams::writeOutput(std::string_view text) {
  std::ignore = writeAll(STDOUT_FILENO, text);
}

}  // namespace host
