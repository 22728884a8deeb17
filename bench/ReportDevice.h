// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// A device root with as many counters as a measurement wants.
#pragma once

#include <cstdint>
#include <string>

#include "bench/Process.h"
#include "host/Host.h"
#include "plist/Value.h"
#include "support/TemporaryFolder.h"
#include "tools/mkdevice/Sample.h"

namespace bench {

// Removes the logs that runs have left in a device root.
void forgetLogs(const support::TemporaryFolder& root);

// Its history holds three days up to yesterday, and a whitelist lets it all through: a tenth by
// exact keys, the rest by prefixes, as families of counters are whitelisted; with roundings and,
// for every tenth distribution, a histogram.
class ReportDevice {
 public:
  ReportDevice(int scalars, int distributions, int samples);

  // Gives it a storage controller with all its buffers, a kernel snapshot, the crash-reporting
  // module and some data usage, on a day on which storage counters go to the counters service.
  void addStorage(mkdevice::ControllerKind controller);

  const std::string& path() const { return path_; }
  std::int32_t yesterday() const { return yesterday_; }

  // Takes back what a run has left that would change the next one.
  void forgetRuns() const;

  // The command lines of a run of the program, as if it were the first of the week; of the bare
  // work; of the same job in Python.
  Arguments report() const;
  Arguments bareReport() const;
  Arguments pythonReport() const;

 private:
  std::string database() const { return root_ / support::kCountersDatabase; }
  void writePropertyList(const std::string& path, const plist::Value& value);
  void fill(int scalars, int distributions, int samples);

  support::TemporaryFolder root_;
  host::Host host_{{.root = root_.path()}};
  std::string path_ = root_.path();
  std::int32_t yesterday_ = 0;
  Arguments buffers_;  // of the controller: the statistics, then the lists
};

}  // namespace bench
