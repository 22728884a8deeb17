// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The terminal that a command may stand at.
#pragma once

#include <cstddef>
#include <ostream>
#include <string>

namespace tools {

// The columns of the terminal that standard output is; 80 where it is none.
std::size_t terminalWidth();

// How far long work is: one line on a terminal that is written over again and again.
class Progress {
 public:
  // Shows nothing where there is no terminal.
  Progress(std::ostream& out, bool isTerminal) : out_(out), isTerminal_(isTerminal) {}
  ~Progress() { clear(); }
  Progress(const Progress&) = delete;
  Progress& operator=(const Progress&) = delete;

  void show(const std::string& text);

  // Makes room for another line.
  void clear();

 private:
  std::ostream& out_;
  const bool isTerminal_;
  bool isShown_ = false;
};

}  // namespace tools
