// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The system log.
#pragma once

#include <string_view>

#include "base/Exported.h"

namespace MORVEND_EXPORTED platform {

// "standard" is the level that the log itself calls default; a notice is a standard line.
enum class LogLevel { debug, info, standard, error };

class SystemLog {
 public:
  virtual ~SystemLog() = default;

  // Whether lines of this level are kept. Lines that aren't cost no formatting.
  bool shows(LogLevel level) const { return level >= lowest_; }

  // Formats and writes one message; it may have several lines.
  void log(LogLevel level, const char* format, ...) __attribute__((format(printf, 3, 4)));

 protected:
  explicit SystemLog(LogLevel lowest) : lowest_(lowest) {}

 private:
  // The format is what messages of one kind have in common.
  virtual void write(LogLevel level, std::string_view format, std::string_view message) = 0;

  LogLevel lowest_;
};

}  // namespace platform
