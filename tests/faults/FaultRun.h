// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Runs a program with a fault at the n-th of its calls of a class; see FaultShim.c for what is
// counted and for the kinds.
#pragma once

#include <cstddef>
#include <string>
#include <vector>

namespace faults {

// Every kind, for tests that go through all of them.
inline constexpr const char* kKinds[] = {"kill-before", "kill-after", "EIO",       "ENOSPC",
                                         "short",       "EMFILE",     "unreadable"};

// The shim can't be loaded into a program that is built with a sanitizer; why, for GTEST_SKIP.
bool available();
inline constexpr char kUnavailable[] = "a sanitizer's run-time library must be the first to load";

using Strings = std::vector<std::string>;

struct Fault {
  std::size_t at = 0;  // from 1; 0 is no fault
  std::string kind = {};
  bool onward = false;  // every later call, too
  bool hurry = false;   // the program doesn't sleep, as it doesn't where calls fail
};

struct Outcome {
  int status;  // of a normal exit, else -1
  int signal;  // that ended the program, else 0
  std::string standardError;
};

// Runs argv[0] to its end. The environment, "NAME=value" each, is added to this process's.
Outcome run(const Strings& argv, const Strings& environment, const Fault& fault = {});

// The number of calls at which a run without a fault could have one of this kind; 0 if it doesn't
// end normally.
std::size_t count(const Strings& argv, const Strings& environment, const std::string& kind);

}  // namespace faults
