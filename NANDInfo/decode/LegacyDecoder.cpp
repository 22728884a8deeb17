// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/LegacyDecoder.h"

#include <algorithm>

#include "NANDInfo/KeyTables.h"
#include "NANDInfo/decode/FTLRecord.h"

namespace NANDInfo {

namespace {

constexpr std::uint32_t kReadCountHistoKey = 265;

// The keys that also have a fixed field. A 32-bit one keeps the low half of the value.
template <typename T>
struct FixedField {
  std::uint32_t key;
  T LegacyNandInfoCxt::*field;
};

constexpr FixedField<std::uint32_t> kFixedFields32[] = {
    {49, &LegacyNandInfoCxt::bytesPerPage},          {50, &LegacyNandInfoCxt::pagesPerVirtualBlock},
    {51, &LegacyNandInfoCxt::blocksPerVirtualBlock}, {52, &LegacyNandInfoCxt::numVirtualBlocks},
    {53, &LegacyNandInfoCxt::exportVersion},
};

constexpr FixedField<std::uint64_t> kFixedFields64[] = {
    {4, &LegacyNandInfoCxt::hostWrites},
    {7, &LegacyNandInfoCxt::hostReads},
    {12, &LegacyNandInfoCxt::IND_pool_free},
    {13, &LegacyNandInfoCxt::IND_pool_count},
    {17, &LegacyNandInfoCxt::wearLevMoves},
    {18, &LegacyNandInfoCxt::nandWrites},
    {19, &LegacyNandInfoCxt::nandReads},
    {20, &LegacyNandInfoCxt::bandErases},
    {28, &LegacyNandInfoCxt::numSleepOps},
    {45, &LegacyNandInfoCxt::maxHighEnduranceBlockErases},
    {48, &LegacyNandInfoCxt::numFreeVirtualBlocks},
    {56, &LegacyNandInfoCxt::utilFormatTime},
};

std::uint64_t valueAt(std::span<const std::byte> values, std::size_t place) {
  return base::littleEndianOfAnyWidth(values.subspan(place * kFTLValueSize, kFTLValueSize));
}

void addSingle(LegacyNandInfoCxt& context, const FTLKey& row, std::uint64_t value) {
  for (const auto& [key, field] : kFixedFields32) {
    if (key == row.key) context.*field = static_cast<std::uint32_t>(value);
  }
  for (const auto& [key, field] : kFixedFields64) {
    if (key == row.key) context.*field = value;
  }
  AddSingleValueToGenericContext(&context.fields, "", row.name, value);
}

void addArray(LegacyNandInfoCxt& context, const FTLKey& row, std::span<const std::byte> values,
              std::uint32_t count) {
  if (row.key == kReadCountHistoKey) {
    auto& histogram = context.readCountHisto;
    for (std::size_t i = 0; i < std::min<std::size_t>(count, histogram.size()); ++i) {
      histogram[i] = valueAt(values, i);
    }
  }
  // An element that stands alone has its index, too.
  if (count == 1) {
    AddSingleValueToGenericContext(&context.fields, row.name, "0", valueAt(values, 0));
  } else {
    AddMultipleFieldsToGenericContext(&context.fields, row.name, values, kFTLValueSize, count);
  }
}

}  // namespace

bool decodeLegacy(std::span<const std::byte> buffer, LegacyNandInfoCxt& context) {
  context.driverVersion = 0xFFFFFFFF;
  base::ByteReader words(buffer);
  bool hasHeader = false;
  while (const auto header = readFTLHeader(words)) {
    hasHeader = true;
    const auto values = takeFTLValues(words, *header);
    if (header->key > kMaxFTLKey || !values) {
      context.exportVersion = 0;
      return false;
    }
    const FTLKey* row = findFTLKey(header->key);
    if (row == nullptr || header->count == 0) continue;
    if (row->elements == 1) {
      addSingle(context, *row, valueAt(*values, 0));
    } else {
      addArray(context, *row, *values, std::min<std::uint32_t>(header->count, row->elements));
    }
  }
  return hasHeader;
}

}  // namespace NANDInfo
