// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/process/StandardErrorLog.h"

#include <string>
#include <tuple>

#include "host/files/Files.h"

namespace host {

namespace {

// In a row.
constexpr std::size_t kMaxMessages = 10, kMaxDirectTexts = 3;

constexpr struct {
  platform::LogLevel level;
  std::string_view name, prefix;
} kLevels[] = {
    {platform::LogLevel::debug, "debug", "<7>"},
    {platform::LogLevel::info, "info", "<6>"},
    {platform::LogLevel::standard, "default", "<5>"},
    {platform::LogLevel::error, "error", "<3>"},
};

std::string_view prefixOf(platform::LogLevel level) {
  for (const auto& row : kLevels) {
    if (row.level == level) return row.prefix;
  }
  return {};
}

}  // namespace

StandardErrorLog::StandardErrorLog(platform::LogLevel lowest, int file)
    : platform::SystemLog(lowest), file_(file), terminal_(::isatty(file) == 1) {}

platform::LogLevel StandardErrorLog::levelNamed(const char* name) {
  for (const auto& row : kLevels) {
    if (name != nullptr && row.name == name) return row.level;
  }
  return platform::LogLevel::standard;
}

StandardErrorLog::~StandardErrorLog() { endRow(); }

void StandardErrorLog::write(platform::LogLevel level, std::string_view format,
                             std::string_view message) {
  const std::scoped_lock lock(mutex_);
  const std::string_view prefix = terminal_ ? std::string_view() : prefixOf(level);
  // Who asks for the lower levels is to see all of them.
  if (level < platform::LogLevel::standard) {
    endRow();
    return writeLines(prefix, message);
  }
  // "%s" says nothing of its messages.
  writeNext(format == "%s" ? message : format, prefix, message, kMaxMessages);
}

void StandardErrorLog::writeDirect(std::string_view text) {
  const std::scoped_lock lock(mutex_);
  writeNext(text.substr(0, text.find_first_of("0123456789")), {}, text, kMaxDirectTexts);
}

void StandardErrorLog::writeNext(std::string_view kind, std::string_view prefix,
                                 std::string_view message, std::size_t maxSaid) {
  const FloodGate::Next next = gate_.next(kind, message, maxSaid);
  if (next.before) writeLines(lastPrefix_, *next.before);
  lastPrefix_ = prefix;
  if (next.said) writeLines(prefix, message);
}

void StandardErrorLog::endRow() {
  if (const auto rest = gate_.end()) writeLines(lastPrefix_, *rest);
}

void StandardErrorLog::writeLines(std::string_view prefix, std::string_view message) {
  if (message.ends_with('\n')) message.remove_suffix(1);
  std::string text;
  text.reserve(message.size() + prefix.size() + 1);
  while (true) {
    const std::size_t end = message.find('\n');
    text.append(prefix).append(message.substr(0, end)).push_back('\n');
    if (end == message.npos) break;
    message.remove_prefix(end + 1);
  }
  std::ignore = writeAll(file_, text);
}

}  // namespace host
