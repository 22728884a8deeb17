// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/TelemetryList.h"

#include <algorithm>
#include <iterator>
#include <tuple>

#include "NANDInfo/decode/Hex.h"
#include "base/ByteReader.h"
#include "base/Text.h"

namespace NANDInfo {

namespace {

constexpr const char* kSummaryFields[] = {"RD",  "PE",         "Max_PE_rate", "t0",
                                          "Ret", "block_type", "num_pages"};
static_assert(sizeof(std::uint32_t) * std::size(kSummaryFields) <= kTelemetrySummarySize);

struct Region {
  const char* name;
  std::size_t firstWord;    // of the record
  std::size_t elements[3];  // logged, by kind of chip
};

constexpr Region kRegions[] = {
    {"readStage", 0, {23, 23, 33}},
    {"initialReadStage", 33, {23, 23, 23}},
    {"nandStageOfLife", 56, {8, 8, 8}},
    {"dspExceptionParameter", 65, {12, 12, 38}},
    {"readStage18NumOfErrorsBin", 103, {12, 12, 12}},
    {"readStage9NumOfErrorsBin", 115, {10, 10, 10}},
    {"readStage10NumOfErrorsBin", 125, {10, 10, 10}},
    {"readStage17NumOfErrorsBin", 135, {10, 10, 10}},
    {"readStage19NumOfErrorsBin", 145, {12, 12, 12}},
    {"algoNANDAccessesBin", 157, {0, 8, 0}},
    {"retentionIndication", 165, {0, 0, 12}},
};

constexpr bool regionsAreApart() {
  std::size_t end = 0;
  for (const Region& region : kRegions) {
    if (region.firstWord < end) return false;
    end = region.firstWord + std::ranges::max(region.elements);
  }
  return end <= std::tuple_size_v<NandCountersRecord>;
}
static_assert(regionsAreApart());

struct VendorConverter {
  std::uint64_t vendor;
  CounterConverter* convert;
};

constexpr VendorConverter kVendorConverters[] = {
    {0x4582603A5700, parseCounters1xSandisk},
    {0x458260DE5700, parseCounters1xSandisk},
    {0xAD8252232100, parseCounters1xHynix},
};

}  // namespace

base::Result<std::vector<TelemetryChannel>> parseTelemetryList(std::span<const std::byte> buffer,
                                                               std::int32_t channels) {
  const auto count = static_cast<std::uint64_t>(std::max(channels, 0));
  base::ByteReader reader(buffer);
  const auto blocks = reader.take(count * kCounterBlockSize);
  const auto summaries = reader.take(count * kTelemetrySummarySize);
  if (!blocks || !summaries) {
    return base::Error{base::format("there are not %d channels in it", channels)};
  }
  std::vector<TelemetryChannel> list;
  for (std::size_t i = 0; i < count; ++i) {
    list.push_back({blocks->subspan(i * kCounterBlockSize).first<kCounterBlockSize>(),
                    summaries->subspan(i * kTelemetrySummarySize).first<kTelemetrySummarySize>()});
  }
  return list;
}

ChipKind chipKind(std::string_view chipIdentifier) {
  if (chipIdentifier == "QM7") return ChipKind::QM7;
  if (chipIdentifier == "QM8") return ChipKind::QM8;
  return ChipKind::other;
}

Vendor vendorOf(std::string_view manufacturerIdentifier) {
  const HexNumber high = hexNumber(manufacturerIdentifier.substr(0, 4));
  const HexNumber low = hexNumber(
      manufacturerIdentifier.substr(std::min<std::size_t>(4, manufacturerIdentifier.size())));
  return {std::uint64_t{high.value & 0xFFFF} << 32 | (low.value & 0xFFFFFF00),
          high.complaint + low.complaint};
}

CounterConverter* counterConverter(ChipKind chip, std::uint64_t vendor) {
  if (chip == ChipKind::QM7) return parseCountersAlgoGeneric;
  if (chip == ChipKind::QM8) return parseCountersAlgoGenericQ8;
  const auto* row = std::ranges::find(kVendorConverters, vendor, &VendorConverter::vendor);
  return row != std::end(kVendorConverters) ? row->convert : parseCounters1y;
}

plist::Dictionary telemetryLog(const TelemetryChannel& channel, ChipKind chip,
                               CounterConverter* convert) {
  NandCountersRecord record{};
  convert(channel.counters, record);
  plist::Dictionary log;
  base::ByteReader summary(channel.summary);
  for (const char* field : kSummaryFields) {
    log.set(field, static_cast<std::int32_t>(summary.read<std::uint32_t>().value_or(0)));
  }
  for (const Region& region : kRegions) {
    const std::size_t elements = region.elements[static_cast<std::size_t>(chip)];
    for (std::size_t i = 0; i < elements; ++i) {
      log.set(base::format("%s[%d]", region.name, static_cast<int>(i)),
              static_cast<std::int32_t>(record[region.firstWord + i]));
    }
  }
  return log;
}

}  // namespace NANDInfo
