// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The process's standard streams.
#pragma once

#include <mutex>

#include "host/process/FloodGate.h"
#include "platform/StandardStreams.h"

namespace host {

// Of texts on standard error that differ by their numbers at most, three in a row are written; a
// line then says how many there were beyond, at the latest when this goes. Any thread may write.
class StandardStreams : public platform::StandardStreams {
 public:
  ~StandardStreams() override;
  void writeError(std::string_view text) override;
  void writeOutput(std::string_view text) override;

 private:
  std::mutex mutex_;
  FloodGate gate_{3};
};

}  // namespace host
