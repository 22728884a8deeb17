// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Runs a program with a fault at the n-th of its state-changing calls; see FaultShim.c for what is
// counted and for the kinds.
#pragma once

#include <cstddef>
#include <string>
#include <vector>

namespace faults {

// Every kind, for tests that go through all of them.
inline constexpr const char* kKinds[] = {"kill-before", "kill-after", "EIO", "ENOSPC", "short"};

// The shim can't be loaded into a program that is built with a sanitizer; why, for GTEST_SKIP.
bool available();
inline constexpr char kUnavailable[] = "a sanitizer's run-time library must be the first to load";

using Strings = std::vector<std::string>;

struct Fault {
  std::size_t at = 0;  // from 1; 0 is no fault
  std::string kind;
  bool onward = false;  // every later call, too
};

struct Outcome {
  int status;  // of a normal exit, else -1
  int signal;  // that ended the program, else 0
  std::string standardError;
};

// Runs argv[0] to its end. The environment, "NAME=value" each, is added to this process's.
Outcome run(const Strings& argv, const Strings& environment, const Fault& fault = {});

// The number of state-changing calls of a run without a fault; 0 if it doesn't end normally.
std::size_t count(const Strings& argv, const Strings& environment);

}  // namespace faults
