// The property-list codec of the host: reads both encodings, writes XML.
#pragma once

#include "platform/PropertyListCodec.h"

namespace platform::host {

class HostPropertyListCodec : public PropertyListCodec {
 public:
  // What begins with "bplist" is binary, everything else XML.
  Result<Value> read(std::string_view bytes) override;
  Result<std::string> writeXML(const Value& value) override;
};

}  // namespace platform::host
