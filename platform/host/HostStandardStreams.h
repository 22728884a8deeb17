// The process's standard streams.
#pragma once

#include "platform/StandardStreams.h"

namespace platform::host {

class HostStandardStreams : public StandardStreams {
 public:
  void writeError(std::string_view text) override;
  void writeOutput(std::string_view text) override;
};

}  // namespace platform::host
