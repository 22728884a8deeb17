// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Captured buffers as the command decodes them, the first byte choosing the decoder: whatever they
// are, it says what came of them, and nothing that it prints can move a terminal's cursor.
#include <cstdint>
#include <iterator>

#include "Input.h"
#include "NANDInfo/queries/DecodedBuffer.h"
#include "tools/nandinfo/TableText.h"

using fuzz::require;

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size) {
  using namespace NANDInfo;
  const auto telemetry = [](Bytes buffer) {
    const auto channels = buffer.empty() ? 0u : std::to_integer<std::uint32_t>(buffer.front());
    return decodedTelemetry(buffer, counterLayouts().front(), channels % 4);
  };
  constexpr plist::Dictionary (*kDecoders[])(Bytes buffer) = {
      decodedFTL,      decodedFTLStat, decodedLegacy,   decodedMSP,
      decodedValidity, decodedDefects, decodedSnapshot, +telemetry};
  fuzz::Input input(bytes, size);
  const auto decode = kDecoders[input.number<std::uint8_t>() % std::size(kDecoders)];
  const plist::Dictionary decoded = decode(input.rest());
  require(decoded.number("ok") != nullptr && decoded.text("error") != nullptr,
          "it says what came of it");
  for (const char c : nandinfo::tableText(decoded, 80)) {
    require(static_cast<unsigned char>(c) >= 0x20 || c == '\n', "a terminal's cursor stays");
  }
  return 0;
}
