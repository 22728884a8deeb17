// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/machine/SourceFiles.h"

#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <charconv>
#include <cstddef>
#include <cstdint>
#include <limits>
#include <optional>
#include <string>
#include <string_view>
#include <system_error>
#include <vector>

#include "host/files/Files.h"

namespace host::machine {

namespace {

// The value of an assignment without its quotes and escapes.
std::string unquoted(std::string_view text) {
  if (text.size() >= 2 && (text.front() == '"' || text.front() == '\'') &&
      text.back() == text.front()) {
    text = text.substr(1, text.size() - 2);
  }
  std::string value;
  for (std::size_t i = 0; i < text.size(); ++i) {
    if (text[i] == '\\' && i + 1 < text.size()) ++i;
    value.push_back(text[i]);
  }
  return value;
}

}  // namespace

std::string_view takeUntil(std::string_view& text, char separator) {
  const auto end = std::min(text.find(separator), text.size());
  const std::string_view part = text.substr(0, end);
  text.remove_prefix(std::min(end + 1, text.size()));
  return part;
}

std::string_view takeWord(std::string_view& line) {
  line.remove_prefix(std::min(line.find_first_not_of(" \t"), line.size()));
  const auto end = std::min(line.find_first_of(" \t"), line.size());
  const std::string_view word = line.substr(0, end);
  line.remove_prefix(end);
  return word;
}

std::optional<std::uint64_t> countIn(std::string_view word) {
  const bool isHexadecimal = word.starts_with("0x");
  if (isHexadecimal) word.remove_prefix(2);
  std::uint64_t value = 0;
  const auto [end, error] =
      std::from_chars(word.data(), word.data() + word.size(), value, isHexadecimal ? 16 : 10);
  if (word.empty() || end != word.data() + word.size()) return std::nullopt;
  if (error == std::errc::result_out_of_range) return std::numeric_limits<std::uint64_t>::max();
  return error == std::errc() ? std::optional(value) : std::nullopt;
}

std::optional<std::string> sourceText(const DeviceRoot& files, std::string_view path,
                                      std::size_t maximum) {
  const auto file = files.openForReading(path);
  struct stat status;
  if (!file || ::fstat(file->get(), &status) != 0 || !S_ISREG(status.st_mode)) return std::nullopt;
  std::string text(maximum + 1, '\0');
  std::size_t filled = 0;
  while (filled < text.size()) {
    const ssize_t got = ::read(file->get(), text.data() + filled, text.size() - filled);
    if (got < 0 && errno == EINTR) continue;
    if (got < 0) return std::nullopt;
    if (got == 0) break;
    filled += static_cast<std::size_t>(got);
  }
  if (filled > maximum) return std::nullopt;
  text.resize(filled);
  return text;
}

std::optional<std::string> sourceLine(const DeviceRoot& files, std::string_view path) {
  constexpr std::string_view kBlanks(" \t\r\0", 4);
  const auto text = sourceText(files, path);
  if (!text) return std::nullopt;
  std::string_view rest = *text;
  std::string_view line = takeUntil(rest, '\n');
  line.remove_prefix(std::min(line.find_first_not_of(kBlanks), line.size()));
  line = line.substr(0, line.find_last_not_of(kBlanks) + 1);
  return line.empty() ? std::nullopt : std::optional<std::string>(line);
}

std::optional<std::uint64_t> sourceCount(const DeviceRoot& files, std::string_view path) {
  const auto line = sourceLine(files, path);
  return line ? countIn(*line) : std::nullopt;
}

std::vector<std::string> sourceNames(const DeviceRoot& files, std::string_view path) {
  const auto folder =
      files.openFolder(path, DeviceRoot::Missing::fails, DeviceRoot::Links::followed);
  if (!folder) return {};
  return namesInFolder(folder->get(), kMaxNames).orNone().value_or(std::vector<std::string>());
}

std::string inKey(std::string_view name) {
  constexpr std::size_t kMaxName = 64;
  std::string part(name.substr(0, kMaxName));
  std::ranges::replace_if(
      part, [](unsigned char c) { return c <= ' ' || c >= 0x7f; }, '_');
  return part;
}

std::vector<SourceDevice> sourceDevices(const DeviceRoot& files, const std::string& path) {
  std::vector<SourceDevice> devices;
  for (const std::string& name : sourceNames(files, path)) {
    if (devices.size() == kMaxDevices) break;
    devices.push_back({path + "/" + name, inKey(name)});
  }
  return devices;
}

std::string driverOf(const DeviceRoot& files, const std::string& device) {
  const auto lines = sourceText(files, device + "/uevent");
  return lines ? inKey(assignedValue(*lines, "DRIVER")) : std::string();
}

std::optional<std::uint64_t> countNamed(const std::optional<std::string>& text,
                                        std::string_view name) {
  if (!text) return std::nullopt;
  for (std::string_view lines = *text; !lines.empty();) {
    std::string_view line = takeUntil(lines, '\n');
    if (takeWord(line) == name) return countIn(takeWord(line));
  }
  return std::nullopt;
}

std::string assignedValue(std::string_view lines, std::string_view name) {
  std::string value;
  while (!lines.empty()) {
    const std::string_view line = takeUntil(lines, '\n');
    if (line.starts_with(name) && line.substr(name.size()).starts_with('=')) {
      value = unquoted(line.substr(name.size() + 1));
    }
  }
  return value;
}

}  // namespace host::machine
