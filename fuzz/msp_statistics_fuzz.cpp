// MSP statistics.

#include "CounterParser.h"
#include "NANDInfo/Parsers.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  const auto bytes = std::as_bytes(std::span(data, size));
  fuzz::checkCounterParser(NANDInfo::ZMCMSPParseBufferToCxt, bytes, 4);
  return 0;
}
