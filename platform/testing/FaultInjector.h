// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// A decorator of a whole platform that makes the n-th call which can fail do so.
#pragma once

#include <memory>

#include "platform/AllServices.h"

namespace platform::fakes {

// Decorated are the services that have a failure to report: files, property lists, history,
// preferences (a read finds nothing), submission, events, listener, device properties, system
// version, kernel, libraries, registry, drivers, snapshots, purgeable space, reporting channels and
// network usage (a reply without records). All other services are the inner platform's own.
class FaultInjector {
 public:
  explicit FaultInjector(const AllServices& inner);
  ~FaultInjector();

  const AllServices& platform() const;

  // The number of calls that could have failed so far, and the one that does (1 is the first; 0:
  // none).
  int calls() const;
  void failAt(int call);

 private:
  struct Decorated;
  std::unique_ptr<Decorated> decorated_;
};

}  // namespace platform::fakes
