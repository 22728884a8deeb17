// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The system log on standard error.
#pragma once

#include <unistd.h>

#include "platform/SystemLog.h"

namespace host {

// Each message is written with one call, so that the lines of two processes don't mix. Where it
// goes to a terminal it stands alone, elsewhere every line of it follows the "<N>" priority prefix
// of the journal. What can't be written is lost. The process is expected to ignore SIGPIPE.
class StandardErrorLog : public platform::SystemLog {
 public:
  explicit StandardErrorLog(platform::LogLevel lowest, int file = STDERR_FILENO);

  // The level that a text names: "debug", "info", "default" or "error". Any other text, or none
  // (null), is the default level.
  static platform::LogLevel levelNamed(const char* name);

 private:
  void write(platform::LogLevel level, std::string_view message) override;

  int file_;
  bool terminal_;
};

}  // namespace host
