// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The signals that ask the process to end, SIGTERM and SIGINT, for a process that ends only between
// one piece of work and the next.
#pragma once

#include <csignal>

namespace host {

inline constexpr int kEndSignals[] = {SIGTERM, SIGINT};

// From now on they end nothing by themselves: they wait to be asked for, as the event loop does
// (Bus.h). For this thread and those that it starts, so to be called before any other starts.
void deferEndSignals();

// Whether one was sent that nobody has taken yet; never, unless they are deferred.
bool endSignalWaits();

}  // namespace host
