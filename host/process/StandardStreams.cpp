// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/process/StandardStreams.h"

#include <unistd.h>

#include <string>
#include <tuple>

#include "host/files/Files.h"

namespace host {

namespace {

void writeErrorLine(std::string_view text) {
  std::string line(text);
  if (!line.ends_with('\n')) line += '\n';
  std::ignore = writeAll(STDERR_FILENO, line);
}

}  // namespace

StandardStreams::~StandardStreams() {
  if (const auto rest = gate_.end()) writeErrorLine(*rest);
}

void StandardStreams::writeError(std::string_view text) {
  const std::scoped_lock lock(mutex_);
  const std::string_view upToNumber = text.substr(0, text.find_first_of("0123456789"));
  const FloodGate::Next next = gate_.next(upToNumber, text);
  if (next.before) writeErrorLine(*next.before);
  if (next.said) writeErrorLine(text);
}

void StandardStreams::writeOutput(std::string_view text) {
  std::ignore = writeAll(STDOUT_FILENO, text);
}

}  // namespace host
