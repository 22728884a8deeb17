#include "platform/host/PropertyListXMLReader.h"

#include "PropertyListRoundTrip.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size) {
  fuzz::checkRoundTrip(platform::host::readXMLPropertyList, bytes, size);
  return 0;
}
