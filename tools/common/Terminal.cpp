// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/common/Terminal.h"

#include <sys/ioctl.h>
#include <unistd.h>

#include <utility>

#include "tools/common/TerminalText.h"

namespace tools {

namespace {

constexpr char kClearLine[] = "\r\x1b[K";

}  // namespace

std::size_t terminalWidth() {
  constexpr std::size_t kUsualWidth = 80;
  winsize size{};
  const bool known = ::ioctl(STDOUT_FILENO, TIOCGWINSZ, &size) == 0 && size.ws_col > 0;
  return known ? size.ws_col : kUsualWidth;
}

void Progress::show(const std::string& text) {
  if (!isTerminal_) return;
  isShown_ = true;
  out_ << kClearLine << printable(text) << std::flush;
}

void Progress::clear() {
  if (std::exchange(isShown_, false)) out_ << kClearLine << std::flush;
}

}  // namespace tools
