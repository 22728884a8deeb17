// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// FTL statistics in their legacy form, beside the named decoder over the same bytes.

#include <algorithm>

#include "CounterDecoder.h"
#include "NANDInfo/FTLDecoder.h"
#include "NANDInfo/LegacyDecoder.h"

namespace {

// What both decoders make of a name, without the index.
std::string stem(const std::string& name) {
  return name.substr(0, name.find_last_not_of("_0123456789") + 1);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  const auto bytes = std::as_bytes(std::span(data, size));
  bool whole = false;
  const auto legacy = fuzz::checkDecoder(
      [&whole](std::span<const std::byte> buffer, NANDInfo::GenericParserCxt* fields) {
        NANDInfo::LegacyNandInfoCxt context{.fields = std::move(*fields)};
        whole = NANDInfo::decodeLegacy(buffer, context);
        fuzz::require(whole || context.exportVersion == 0);
        fuzz::require(context.driverVersion == 0xFFFFFFFF);
        *fields = std::move(context.fields);
        return NANDInfo::Decoded{static_cast<std::uint32_t>(fields->size()), {}};
      },
      bytes, 8);
  fuzz::require(!whole || size >= 8);

  // Each decoder may stop where the other goes on; as far as both come they agree.
  auto named = fuzz::checkDecoder(NANDInfo::decodeFTL, bytes, 8);
  std::erase_if(named, [](const auto& field) { return field.first.starts_with("Stat_"); });
  for (std::size_t i = 0; i < std::min(legacy.size(), named.size()); ++i) {
    fuzz::require(legacy[i].second == named[i].second);
    fuzz::require(stem(legacy[i].first) == stem(named[i].first));
  }
  return 0;
}
