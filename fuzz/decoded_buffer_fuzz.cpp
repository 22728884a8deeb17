// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Captured buffers as the command decodes them: whatever they are, each decoder says what came of
// them, and nothing that it prints can move a terminal's cursor.
#include <cstdint>
#include <cstdlib>
#include <span>

#include "tools/nandinfo/DecodedBuffer.h"
#include "tools/nandinfo/TableText.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size) {
  using namespace nandinfo;
  const auto telemetry = [](Bytes buffer) {
    const auto channels = buffer.empty() ? 0u : std::to_integer<std::uint32_t>(buffer.front());
    return decodedTelemetry(buffer, counterLayouts().front(), channels % 4);
  };
  for (plist::Dictionary (*decode)(Bytes buffer) :
       {decodedFTL, decodedFTLStat, decodedLegacy, decodedMSP, decodedValidity, decodedDefects,
        decodedSnapshot, +telemetry}) {
    const plist::Dictionary decoded = decode(std::as_bytes(std::span(bytes, size)));
    if (decoded.number("ok") == nullptr || decoded.text("error") == nullptr) std::abort();
    for (const char c : tableText(decoded, 80)) {
      if (static_cast<unsigned char>(c) < 0x20 && c != '\n') std::abort();
    }
  }
  return 0;
}
