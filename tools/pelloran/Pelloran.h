// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The command pelloran: writes and reads the counters.
#pragma once

#include <chrono>
#include <functional>
#include <iosfwd>
#include <ostream>

#include "host/counters/CounterStore.h"
#include "host/figures/MachineFigures.h"
#include "platform/Clock.h"

namespace pelloran {

struct Environment {
  host::CounterStore& store;
  platform::Clock& clock;
  std::istream& in;
  std::ostream& out;
  std::ostream& err;
  bool errIsTerminal;  // then long work shows its progress there
  std::function<host::figures::MachineFigures()> figures;  // of this machine
  std::function<void(std::chrono::steady_clock::time_point)> waitUntil;
  base::Result<void> root = {};  // whether the device root is there
};

// Runs one command line. Returns the exit status: 0 done; 1 the work failed, with one line on `err`
// or in the log; 2 wrong usage.
int runPelloran(const Environment& environment, int argc, const char* const* argv);

}  // namespace pelloran
