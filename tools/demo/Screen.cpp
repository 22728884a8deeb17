// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/demo/Screen.h"

#include <unistd.h>

#include <algorithm>
#include <cmath>

#include "tools/common/Terminal.h"
#include "tools/common/TerminalText.h"

namespace demo {

std::size_t screenWidth() { return std::clamp<std::size_t>(tools::terminalWidth(), 60, 160); }

std::string heading(std::string_view text) {
  static const bool terminal = ::isatty(STDOUT_FILENO) == 1;
  const std::string line = tools::printable(text);
  return terminal ? "\x1b[1m" + line + "\x1b[0m\n" : line + "\n";
}

std::string shortKey(std::string_view key) {
  constexpr std::string_view kCommon = "com.norba.";
  return key.starts_with(kCommon) ? "~." + std::string(key.substr(kCommon.size()))
                                  : std::string(key);
}

std::string wrapped(const std::vector<std::string>& names) {
  const std::string indent(kIndent, ' ');
  std::string text, line = indent;
  for (const std::string& each : names) {
    const std::string name = tools::printable(each);
    if (line.size() > kIndent && line.size() + 1 + name.size() > screenWidth()) {
      text += line + '\n';
      line = indent;
    }
    if (line.size() > kIndent) line += ' ';
    line += name;
  }
  return line.size() > kIndent ? text + line + '\n' : text;
}

std::string bar(double share, std::size_t width) {
  static constexpr const char* kEighths[] = {"", "▏", "▎", "▍", "▌", "▋", "▊", "▉"};
  auto eighths = static_cast<std::size_t>(
      std::llround(std::clamp(share, 0.0, 1.0) * static_cast<double>(width * 8)));
  if (share > 0) eighths = std::max<std::size_t>(eighths, 1);
  std::string text;
  for (std::size_t i = 0; i < eighths / 8; ++i) text += "█";
  return text + kEighths[eighths % 8];
}

std::string skyline(std::span<const std::uint64_t> counts) {
  static constexpr const char* kHeights[] = {"▁", "▂", "▃", "▄", "▅", "▆", "▇", "█"};
  const std::uint64_t most = counts.empty() ? 0 : std::ranges::max(counts);
  std::string text;
  for (const std::uint64_t count : counts) {
    const double share = most == 0 ? 0 : static_cast<double>(count) / static_cast<double>(most);
    text += kHeights[std::llround(share * 7)];
  }
  return text;
}

std::vector<std::size_t> evenlySpread(std::size_t count, std::size_t most) {
  const std::size_t shown = std::min(count, most);
  std::vector<std::size_t> indices;
  for (std::size_t i = 0; i < shown; ++i) indices.push_back(i * count / shown);
  return indices;
}

}  // namespace demo
