// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Programs that are measured, as processes.
#pragma once

#include <string>
#include <vector>

namespace bench {

using Arguments = std::vector<std::string>;

// The path of a program that stands beside this one.
std::string program(const char* name);

// Runs a program to its end, its output thrown away; the nanoseconds that this took. Throws when it
// fails.
double run(const Arguments& arguments);

// The same; the most memory, in KiB, that it had at once.
double peakKiB(Arguments arguments);

}  // namespace bench
