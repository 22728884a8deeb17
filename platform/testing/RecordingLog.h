// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// A system log that keeps its lines.
#pragma once

#include <mutex>
#include <string>
#include <vector>

#include "platform/SystemLog.h"

namespace platform::fakes {

class RecordingLog : public SystemLog {
 public:
  explicit RecordingLog(LogLevel lowest = LogLevel::debug) : SystemLog(lowest) {}

  // Every message, preceded by its level: "error: …", "default: …", "info: …", "debug: …".
  std::vector<std::string> lines() const;

  // The number of lines that hold the text.
  int count(std::string_view text) const;

  void clear();

 private:
  void write(LogLevel level, std::string_view format, std::string_view message) override;

  mutable std::mutex mutex_;
  std::vector<std::string> lines_;
};

}  // namespace platform::fakes
