// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/queries/BufferKind.h"

#include <algorithm>
#include <optional>
#include <string_view>

#include "NANDInfo/DefectsList.h"
#include "NANDInfo/FTLDecoder.h"
#include "NANDInfo/MSPDecoder.h"
#include "NANDInfo/TelemetryList.h"
#include "NANDInfo/ValidityList.h"
#include "NANDInfo/queries/SnapshotItems.h"
#include "base/ByteReader.h"
#include "base/Text.h"
#include "base/UTF8.h"

namespace NANDInfo {

namespace {

using base::ByteReader;
using Bytes = std::span<const std::byte>;

std::string_view textOf(Bytes bytes) {
  return {reinterpret_cast<const char*>(bytes.data()), bytes.size()};
}

// UTF-8 without control characters but those of a text file. The first part of a file is enough.
bool isText(Bytes bytes) {
  constexpr std::size_t kLooked = 4096, kMaxCharacterSize = 4;
  std::string_view text = textOf(bytes);
  const std::size_t rest = text.size() > kLooked ? text.size() - kLooked : 0;
  while (text.size() > rest) {
    const std::size_t length = base::characterLength(text);
    const bool control = static_cast<unsigned char>(text[0]) < 0x20 &&
                         std::string_view("\t\n\f\r").find(text[0]) == std::string_view::npos;
    if (length == 0 || control) return false;
    text.remove_prefix(length);
  }
  return bytes.size() >= kMaxCharacterSize;
}

bool isPropertyList(Bytes bytes) {
  const std::string_view text = textOf(bytes);
  return text.starts_with("bplist00") ||
         (isText(bytes) && text.substr(0, 1024).find("<plist") != std::string_view::npos);
}

// What a decoder makes of the bytes without any complaint.
template <auto decode>
std::optional<GenericParserCxt> decodedWithoutComplaint(Bytes bytes) {
  GenericParserCxt fields;
  const Decoded decoded = decode(bytes, &fields);
  const bool whole = decoded.values > 0 && decoded.complaint.empty();
  return whole ? std::optional(std::move(fields)) : std::nullopt;
}

// Most fields have a name of their own, and the fields take up the bytes.
bool isFTLStatistics(Bytes bytes) {
  constexpr std::size_t kMaxFieldSize = 16;  // a header and one value
  const auto fields = decodedWithoutComplaint<decodeFTL>(bytes);
  if (!fields || fields->size() * kMaxFieldSize < bytes.size()) return false;
  std::size_t named = 0;
  for (std::size_t i = 0; i < fields->size(); ++i) {
    if (!std::string_view((*fields)[i].name).starts_with("Stat_")) ++named;
  }
  return named * 2 >= fields->size();
}

bool isMSPStatistics(Bytes bytes) {
  constexpr std::size_t kMaxFieldSize = 12;
  const auto fields = decodedWithoutComplaint<decodeMSP>(bytes);
  return fields && fields->size() * kMaxFieldSize >= bytes.size();
}

bool isSnapshot(Bytes bytes) {
  SnapshotItems items(bytes);
  bool hasContainer = false;
  while (const auto item = items.next()) hasContainer |= item->type == kContainerBegin;
  return hasContainer && items.isWhole();
}

bool isDefectsList(Bytes bytes) {
  const auto defects = DefectsList::parse(bytes);
  if (!defects || defects->size() == 0) return false;
  for (std::size_t i = 0; i < defects->size(); ++i) {
    if (!reasonOffset((*defects)[i].mode)) return false;
  }
  ByteReader header(bytes);
  header.read<std::uint64_t>();
  return header.read<std::uint32_t>() == defects->size() &&
         bytes.size() == DefectsList::kHeaderSize + defects->size() * DefectsList::kRecordSize;
}

// Every record of the list is one of a list that there is, and the last one ends the bytes.
bool isValidityList(Bytes bytes) {
  constexpr std::uint64_t kHeaderUnit = 8, kRecordSize = 20;
  const auto lists = parseValidityList(bytes);
  if (!lists) return false;
  ByteReader header(bytes);
  const std::uint64_t count = *header.read<std::uint32_t>();
  const std::uint64_t end = *header.read<std::uint32_t>() * kHeaderUnit + count * kRecordSize;
  std::size_t values = 0;
  for (const auto& list : *lists) values += list.size();
  return values == count && bytes.size() - end < kHeaderUnit;
}

bool isUnknown(Bytes) { return false; }

// In the order of the enumeration.
struct Row {
  BufferKind kind;
  const char* name;
  std::size_t least;  // bytes that hold anything
  bool (*recognise)(Bytes bytes);
};
constexpr Row kRows[] = {
    {BufferKind::text, "a text", 0, isText},
    {BufferKind::propertyList, "a property list", 0, isPropertyList},
    {BufferKind::snapshot, "a kernel snapshot", 16, isSnapshot},
    {BufferKind::FTLStatistics, "FTL statistics", 8, isFTLStatistics},
    {BufferKind::MSPStatistics, "MSP statistics", 4, isMSPStatistics},
    {BufferKind::defects, "a defects list", DefectsList::kHeaderSize, isDefectsList},
    {BufferKind::validity, "a validity list", 8, isValidityList},
    {BufferKind::telemetry, "a telemetry list", kCounterBlockSize + kTelemetrySummarySize,
     isUnknown},
    {BufferKind::counters, "a counter block", 0, isUnknown},
};

}  // namespace

std::string whyNot(BufferKind wanted, Bytes bytes) {
  const Row& own = kRows[static_cast<std::size_t>(wanted)];
  if (own.recognise(bytes)) return {};
  // A property list is a text, too: the last row that agrees says more.
  const auto other = std::find_if(std::rbegin(kRows), std::rend(kRows),
                                  [bytes](const Row& row) { return row.recognise(bytes); });
  if (other != std::rend(kRows)) {
    return base::format("it holds %s, not %s", other->name, own.name);
  }
  if (bytes.size() >= own.least) return {};
  return base::format("%zu bytes are too few for %s", bytes.size(), own.name);
}

}  // namespace NANDInfo
