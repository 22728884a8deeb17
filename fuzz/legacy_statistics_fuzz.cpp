// FTL statistics in their legacy form, beside the named parser over the same bytes.

#include <algorithm>

#include "CounterParser.h"
#include "NANDInfo/Parsers.h"

namespace {

// What both parsers make of a name, without the index.
std::string stem(const std::string& name) {
  return name.substr(0, name.find_last_not_of("_0123456789") + 1);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  const auto bytes = std::as_bytes(std::span(data, size));
  bool whole = false;
  const auto legacy = fuzz::checkCounterParser(
      [&whole](NANDInfo::GenericParserCxt* fields, std::span<const std::byte> buffer) {
        NANDInfo::LegacyNandInfoCxt context{.fields = std::move(*fields)};
        whole = NANDInfo::ZMCParseBufferToCxt(&context, buffer);
        fuzz::require(whole || context.exportVersion == 0);
        fuzz::require(context.driverVersion == 0xFFFFFFFF);
        *fields = std::move(context.fields);
        return static_cast<std::uint32_t>(fields->size());
      },
      bytes, 8);
  fuzz::require(!whole || size >= 8);

  // Each parser may stop where the other goes on; as far as both come they agree.
  auto named = fuzz::checkCounterParser(NANDInfo::ZMCFTLParseBufferToCxt, bytes, 8);
  std::erase_if(named, [](const auto& field) { return field.first.starts_with("Stat_"); });
  for (std::size_t i = 0; i < std::min(legacy.size(), named.size()); ++i) {
    fuzz::require(legacy[i].second == named[i].second);
    fuzz::require(stem(legacy[i].first) == stem(named[i].first));
  }
  return 0;
}
