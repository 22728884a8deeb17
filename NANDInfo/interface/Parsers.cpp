// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/Parsers.h"

#include <utility>

#include "NANDInfo/APIErrorMessage.h"
#include "NANDInfo/FTLDecoder.h"
#include "NANDInfo/LegacyDecoder.h"
#include "NANDInfo/MSPDecoder.h"

namespace NANDInfo {

namespace {

std::uint32_t recorded(const Decoded& decoded) {
  if (!decoded.complaint.empty()) SetAPIErrorMessage("%s", decoded.complaint.c_str());
  return decoded.values;
}

}  // namespace

std::uint32_t ZMCFTLParseBufferToCxt(GenericParserCxt* context, std::span<const std::byte> buffer) {
  return recorded(decodeFTL(buffer, context));
}

std::uint32_t ZMCFTLParseStatKeyBufferToCxt(GenericParserCxt* context,
                                            std::span<const std::byte> buffer) {
  return recorded(decodeFTLByKey(buffer, context));
}

std::uint32_t ZMCMSPParseBufferToCxt(GenericParserCxt* context, std::span<const std::byte> buffer) {
  return recorded(decodeMSP(buffer, context));
}

bool ZMCParseBufferToCxt(LegacyNandInfoCxt* context, std::span<const std::byte> buffer) {
  return context != nullptr && decodeLegacy(buffer, *context);
}

void ZMCReleaseContext(LegacyNandInfoCxt* context) {
  if (context == nullptr) return;
  context->fields.release();
  *context = LegacyNandInfoCxt{.fields = std::move(context->fields)};
}

}  // namespace NANDInfo
