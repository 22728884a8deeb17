// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The process's standard streams.
#pragma once

#include "platform/StandardStreams.h"

namespace host {

class StandardStreams : public platform::StandardStreams {
 public:
  void writeError(std::string_view text) override;
  void writeOutput(std::string_view text) override;
};

}  // namespace host
