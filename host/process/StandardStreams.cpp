// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/process/StandardStreams.h"

#include <unistd.h>

#include <tuple>

#include "host/files/Files.h"

namespace host {

void StandardStreams::writeError(std::string_view text) { log_.writeDirect(text); }

void StandardStreams::writeOutput(std::string_view text) {
  std::ignore = writeAll(STDOUT_FILENO, text);
}

}  // namespace host
