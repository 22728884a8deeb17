#include "platform/host/PropertyListBinaryReader.h"

#include "PropertyListRoundTrip.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size) {
  fuzz::checkRoundTrip(platform::host::readBinaryPropertyList, bytes, size);
  return 0;
}
