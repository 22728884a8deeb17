// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The process's standard streams.
#pragma once

#include "host/process/StandardErrorLog.h"
#include "platform/StandardStreams.h"

namespace host {

class StandardStreams : public platform::StandardStreams {
 public:
  // The log is borrowed.
  explicit StandardStreams(StandardErrorLog& log) : log_(log) {}

  void writeError(std::string_view text) override;
  void writeOutput(std::string_view text) override;

 private:
  StandardErrorLog& log_;
};

}  // namespace host
