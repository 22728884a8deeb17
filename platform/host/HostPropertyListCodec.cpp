#include "platform/host/HostPropertyListCodec.h"

#include "platform/Text.h"
#include "platform/host/PropertyListBinaryReader.h"
#include "platform/host/PropertyListXMLReader.h"
#include "platform/host/PropertyListXMLWriter.h"

namespace platform::host {

Result<Value> HostPropertyListCodec::read(std::string_view bytes) {
  if (bytes.empty()) return Result<Value>::failure("the property list is empty");
  if (bytes.size() > kMaximumPropertyListSize) {
    return Result<Value>::failure(format("the property list has %zu bytes, more than %zu",
                                         bytes.size(), kMaximumPropertyListSize));
  }
  return bytes.starts_with("bplist") ? readBinaryPropertyList(bytes) : readXMLPropertyList(bytes);
}

Result<std::string> HostPropertyListCodec::writeXML(const Value& value) {
  return writeXMLPropertyList(value);
}

}  // namespace platform::host
