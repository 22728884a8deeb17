// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The system log on standard error, and the texts without a level that go there, too.
#pragma once

#include <unistd.h>

#include <cstddef>
#include <mutex>
#include <string_view>

#include "host/process/FloodGate.h"
#include "platform/SystemLog.h"

namespace host {

// Each message is written with one call, so that the lines of two processes don't mix. Where it
// goes to a terminal it stands alone, elsewhere every line of it follows the "<N>" priority prefix
// of the journal. What can't be written is lost. The process is expected to ignore SIGPIPE.
//
// Of the messages of the default level and errors that one place of the program says in a row, ten
// are written, and three of texts without a level; a line then says how many there were beyond, at
// the latest when the log goes. Any thread may write.
class StandardErrorLog : public platform::SystemLog {
 public:
  explicit StandardErrorLog(platform::LogLevel lowest, int file = STDERR_FILENO);
  ~StandardErrorLog() override;

  // The level that a text names: "debug", "info", "default" or "error". Any other text, or none
  // (null), is the default level.
  static platform::LogLevel levelNamed(const char* name);

  // As SystemLog::log does; for a log that hands its messages on.
  void write(platform::LogLevel level, std::string_view format, std::string_view message) override;

  // A text without a level, as it is but for a line feed at its end if it has none. What stands
  // before its first digit is what texts of one kind have in common.
  void writeDirect(std::string_view text);

 private:
  void writeNext(std::string_view kind, std::string_view prefix, std::string_view message,
                 std::size_t maxSaid);
  void writeLines(std::string_view prefix, std::string_view message);
  void endRow();

  int file_;
  bool terminal_;
  std::mutex mutex_;
  FloodGate gate_;
  std::string_view lastPrefix_;  // of the row
};

}  // namespace host
