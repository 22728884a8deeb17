// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Texts that go to the process's standard streams directly, without a level.
#pragma once

#include <string_view>

namespace platform {

class StandardStreams {
 public:
  virtual ~StandardStreams() = default;

  // One text to standard error; a line feed is added if it has none at its end.
  virtual void writeError(std::string_view text) = 0;

  // A text to standard output, as it is.
  virtual void writeOutput(std::string_view text) = 0;
};

}  // namespace platform
