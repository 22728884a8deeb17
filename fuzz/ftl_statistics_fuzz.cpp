// FTL statistics, by name and by key.

#include "CounterParser.h"
#include "NANDInfo/Parsers.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  const auto bytes = std::as_bytes(std::span(data, size));
  const auto named = fuzz::checkCounterParser(NANDInfo::ZMCFTLParseBufferToCxt, bytes, 8);
  const auto byKey = fuzz::checkCounterParser(NANDInfo::ZMCFTLParseStatKeyBufferToCxt, bytes, 8);
  // Both walk the same records; the table only takes values away.
  fuzz::require(named.size() <= byKey.size() && named.empty() == byKey.empty());
  for (const auto& field : byKey) fuzz::require(field.first.starts_with("Stat_"));
  return 0;
}
