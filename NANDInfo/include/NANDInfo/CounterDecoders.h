// The decoders of the controller's counter buffers, as functions of the bytes alone: they ask
// nobody and leave nothing behind but the fields that they append.
#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <string>

#include "NANDInfo/GenericParserContext.h"
#include "NANDInfo/Parsers.h"
#include "base/Exported.h"

namespace MORVEND_EXPORTED NANDInfo {

// What became of a buffer.
struct Decoded {
  std::uint32_t values = 0;  // that count as added, dropped ones among them; 0: it is no buffer
  std::string complaint;     // the first thing that was wrong with it; empty: nothing was
};

// As the parsers of Parsers.h do it; where they would record messages, the first one is handed
// back.
Decoded decodeFTL(std::span<const std::byte> buffer, GenericParserCxt* context);
Decoded decodeFTLByKey(std::span<const std::byte> buffer, GenericParserCxt* context);
Decoded decodeMSP(std::span<const std::byte> buffer, GenericParserCxt* context);

// Whether the whole buffer could be read; what was read of it is in the context.
bool decodeLegacy(std::span<const std::byte> buffer, LegacyNandInfoCxt& context);

}  // namespace NANDInfo
