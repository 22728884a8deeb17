// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "platform/testing/RecordingLog.h"

#include <algorithm>
#include <string_view>

namespace platform::fakes {

namespace {

const char* levelName(LogLevel level) {
  switch (level) {
    case LogLevel::debug:
      return "debug: ";
    case LogLevel::info:
      return "info: ";
    case LogLevel::standard:
      return "default: ";
    case LogLevel::error:
      break;
  }
  return "error: ";
}

}  // namespace

std::vector<std::string> RecordingLog::lines() const {
  const std::scoped_lock lock(mutex_);
  return lines_;
}

int RecordingLog::count(std::string_view text) const {
  const std::scoped_lock lock(mutex_);
  return static_cast<int>(std::count_if(lines_.begin(), lines_.end(), [&](const std::string& line) {
    return line.find(text) != std::string::npos;
  }));
}

void RecordingLog::clear() {
  const std::scoped_lock lock(mutex_);
  lines_.clear();
}

void RecordingLog::write(LogLevel level, std::string_view, std::string_view message) {
  const std::scoped_lock lock(mutex_);
  lines_.push_back(levelName(level) + std::string(message));
}

}  // namespace platform::fakes
