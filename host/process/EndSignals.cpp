// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/process/EndSignals.h"

#include <algorithm>
#include <iterator>

namespace host {

void deferEndSignals() {
  sigset_t signals;
  ::sigemptyset(&signals);
  for (const int signal : kEndSignals) ::sigaddset(&signals, signal);
  ::pthread_sigmask(SIG_BLOCK, &signals, nullptr);
}

bool endSignalWaits() {
  sigset_t waiting;
  ::sigemptyset(&waiting);
  ::sigpending(&waiting);
  return std::any_of(std::begin(kEndSignals), std::end(kEndSignals),
                     [&](int signal) { return ::sigismember(&waiting, signal) == 1; });
}

}  // namespace host
