// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/MSPDecoder.h"

#include <algorithm>
#include <optional>

#include "NANDInfo/KeyTables.h"
#include "NANDInfo/decode/Complaint.h"
#include "base/ByteReader.h"

namespace NANDInfo {

namespace {

constexpr std::uint16_t kEndTag = 0x2FFF;

// The number of elements added; none when memory was refused.
std::optional<std::uint32_t> addElements(GenericParserCxt* context, const MSPTag& row,
                                         std::span<const std::byte> payload, Complaint& complaint) {
  const unsigned tag = row.tag, width = row.width, configured = row.elements;
  if (payload.size() != std::size_t{configured} * width) {
    complaint.say(
        "ZMCMSPParseBufferToCxt: %s(%u): cfg %u elements; (%u*%u) cfg bytes != (%zu) buffer bytes",
        row.name, tag, configured, configured, width, payload.size());
  }
  const auto count =
      static_cast<std::uint32_t>(std::min<std::size_t>(payload.size() / width, configured));
  if (!AddMultipleFieldsToGenericContext(context, row.name, payload, width, count)) {
    complaint.say("ZMCMSPParseBufferToCxt: %s(%u): Error adding %u elements to context", row.name,
                  tag, configured);
    return std::nullopt;
  }
  return count;
}

}  // namespace

Decoded decodeMSP(std::span<const std::byte> buffer, GenericParserCxt* context) {
  if (buffer.empty()) {
    return {0, "ZMCMSPParseBufferToCxt: Passed in invalid buffer or empty buffer"};
  }
  base::ByteReader bytes(buffer);
  std::uint32_t total = 0;
  Complaint complaint;
  while (const auto header = bytes.read<std::uint32_t>()) {
    const std::uint32_t tag = *header & 0xFFFF, length = *header >> 16;
    if (length == 0) continue;
    const auto payload = bytes.take(length);
    if (!payload || tag == kEndTag) break;
    // The skip tag (0x2FFE) is not in the table either.
    const MSPTag* row = findMSPTag(tag);
    if (row == nullptr) continue;
    const auto added = addElements(context, *row, *payload, complaint);
    if (!added) break;
    total += *added;
  }
  return {total, complaint.text()};
}

}  // namespace NANDInfo
