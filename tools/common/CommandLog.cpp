// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/common/CommandLog.h"

#include <unistd.h>

#include <cstdlib>
#include <utility>

#include "host/files/Files.h"
#include "tools/common/TerminalText.h"

namespace tools {

using host::StandardErrorLog;
using platform::LogLevel;

namespace {

// Null when the environment doesn't say, or says nothing.
const char* levelOfEnvironment() {
  const char* level = std::getenv("MORVEND_LOG");
  return level != nullptr && *level != '\0' ? level : nullptr;
}

LogLevel lowestLevel() {
  const char* level = levelOfEnvironment();
  return level != nullptr ? StandardErrorLog::levelNamed(level) : LogLevel::error;
}

}  // namespace

CommandLog::CommandLog(std::string command)
    : SystemLog(lowestLevel()), command_(std::move(command)) {
  if (levelOfEnvironment() != nullptr) systemLog_.emplace(lowestLevel());
}

CommandLog::~CommandLog() {
  for (const std::string& line : take()) say(line);
}

host::HostOptions CommandLog::hostOptions() {
  auto options = host::HostOptions::fromEnvironment();
  options.log = this;
  if (systemLog_) options.standardError = &*systemLog_;
  return options;
}

void CommandLog::keep() {
  const std::lock_guard lock(mutex_);
  keeps_ = true;
}

std::vector<std::string> CommandLog::take() {
  const std::lock_guard lock(mutex_);
  keeps_ = false;
  return std::exchange(kept_, {});
}

void CommandLog::write(LogLevel level, std::string_view format, std::string_view message) {
  if (systemLog_) return systemLog_->write(level, format, message);
  if (message.ends_with('\n')) message.remove_suffix(1);
  const std::lock_guard lock(mutex_);
  if (keeps_) {
    kept_.emplace_back(message);
  } else {
    say(std::string(message));
  }
}

void CommandLog::say(const std::string& line) {
  std::ignore = host::writeAll(STDERR_FILENO, command_ + ": " + printable(line) + '\n');
}

}  // namespace tools
