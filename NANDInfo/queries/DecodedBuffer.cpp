// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/queries/DecodedBuffer.h"

#include <algorithm>
#include <iterator>
#include <string>
#include <utility>
#include <vector>

#include "NANDInfo/DefectsList.h"
#include "NANDInfo/FTLDecoder.h"
#include "NANDInfo/LegacyDecoder.h"
#include "NANDInfo/MSPDecoder.h"
#include "NANDInfo/SnapshotReader.h"
#include "NANDInfo/TelemetryList.h"
#include "NANDInfo/ValidityList.h"
#include "NANDInfo/queries/BufferKind.h"
#include "NANDInfo/queries/SnapshotItems.h"
#include "base/ByteReader.h"
#include "base/Text.h"

namespace NANDInfo {

namespace {

using plist::Array;
using plist::Dictionary;
using plist::Value;

static_assert(kChannelSize == kCounterBlockSize + kTelemetrySummarySize);

Dictionary whole(const Dictionary& content, bool ok, const std::string& error) {
  Dictionary decoded{{"ok", ok}};
  for (const auto& [key, value] : content) decoded.set(key, value);
  decoded.set("error", error);
  return decoded;
}

Dictionary refused(const std::string& why) { return whole({{"fields", Array{}}}, false, why); }

Dictionary withFields(const GenericParserCxt& context, bool ok, const std::string& complaint) {
  Array fields;
  fields.reserve(context.size());
  for (std::size_t i = 0; i < context.size(); ++i) {
    const GenericParserCxt::Field field = context[i];
    fields.push_back(Array{Value(field.name), Value(field.value)});
  }
  return whole({{"fields", std::move(fields)}}, ok, complaint.empty() ? "NA" : complaint);
}

template <auto decode>
Dictionary decoded(BufferKind kind, Bytes bytes) {
  if (const std::string why = whyNot(kind, bytes); !why.empty()) return refused(why);
  GenericParserCxt context;
  const Decoded outcome = decode(bytes, &context);
  return withFields(context, outcome.values > 0, outcome.complaint);
}

std::string typeName(std::uint32_t type) {
  switch (type) {
    case kContainerBegin:
      return "container begin";
    case kContainerEnd:
      return "container end";
    case kIOStatistics:
      return "I/O statistics";
    case kThreadName:
      return "thread name";
    default:
      return base::format("0x%x", type);
  }
}

// One row for each type in the order of their first items; what comes after so many types is one.
Array summedItems(Bytes snapshot) {
  constexpr std::size_t kMaxTypes = 100;
  struct Sum {
    std::string type;
    std::uint64_t count = 0, bytes = 0;
  };
  std::vector<Sum> sums;
  SnapshotItems items(snapshot);
  std::vector<std::uint32_t> types;
  while (const auto item = items.next()) {
    auto place =
        static_cast<std::size_t>(std::find(types.begin(), types.end(), item->type) - types.begin());
    if (place == types.size() && place < kMaxTypes) types.push_back(item->type);
    if (place == sums.size()) {
      sums.push_back({place < kMaxTypes ? typeName(item->type) : "others"});
    }
    ++sums[place].count;
    sums[place].bytes += item->payload.size();
  }
  Array rows;
  for (const Sum& sum : sums) {
    rows.push_back(Dictionary{{"type", sum.type}, {"count", sum.count}, {"bytes", sum.bytes}});
  }
  return rows;
}

constexpr CounterLayout kLayouts[] = {
    {"1y", 533, "", parseCounters1y},
    {"1x-sandisk", 316, "", parseCounters1xSandisk},
    {"1x-hynix", 312, "", parseCounters1xHynix},
    {"generic", 121, "QM7", parseCountersAlgoGeneric},
    {"q8", 127, "QM8", parseCountersAlgoGenericQ8},
};

}  // namespace

Dictionary decodedFTL(Bytes bytes) { return decoded<decodeFTL>(BufferKind::FTLStatistics, bytes); }

Dictionary decodedFTLStat(Bytes bytes) {
  return decoded<decodeFTLByKey>(BufferKind::FTLStatistics, bytes);
}

Dictionary decodedMSP(Bytes bytes) { return decoded<decodeMSP>(BufferKind::MSPStatistics, bytes); }

Dictionary decodedLegacy(Bytes bytes) {
  if (const auto why = whyNot(BufferKind::FTLStatistics, bytes); !why.empty()) return refused(why);
  LegacyNandInfoCxt context;
  const bool ok = decodeLegacy(bytes, context);
  return withFields(context.fields, ok, {});
}

Dictionary decodedValidity(Bytes bytes) {
  if (const auto why = whyNot(BufferKind::validity, bytes); !why.empty()) return refused(why);
  auto lists = parseValidityList(bytes);
  if (!lists) return refused(lists.error().text);
  Array fields;
  for (std::size_t i = 0; i < lists->size(); ++i) {
    if ((*lists)[i].empty()) continue;
    fields.push_back(Array{base::format("ValidityList[%zu]", i), std::move((*lists)[i])});
  }
  return whole({{"fields", std::move(fields)}}, true, "NA");
}

Dictionary decodedDefects(Bytes bytes) {
  if (const auto why = whyNot(BufferKind::defects, bytes); !why.empty()) return refused(why);
  const auto list = DefectsList::parse(bytes);
  Array defects;
  for (std::size_t i = 0; i < list->size(); ++i) {
    const Defect defect = (*list)[i];
    Dictionary row = defectLog(defect);
    row.set("Mode", std::uint64_t{defect.mode});
    defects.push_back(std::move(row));
  }
  return whole(
      {{"Factory Count", std::uint64_t{list->factoryCount()}}, {"defects", std::move(defects)}},
      true, "NA");
}

Dictionary decodedSnapshot(Bytes bytes) {
  if (const auto why = whyNot(BufferKind::snapshot, bytes); !why.empty()) return refused(why);
  Array items = summedItems(bytes);
  const bool hasContainer = std::any_of(items.begin(), items.end(), [](const Value& item) {
    return *item.as<Dictionary>()->text("type") == typeName(kContainerBegin);
  });
  if (!hasContainer) return refused("it has no container, as a snapshot has");
  Array fields;
  constexpr char kThread[] = "VM_swapout";
  if (const auto statistics = getIOStatsWithThreadnameFromKCData(bytes, kThread)) {
    constexpr int kMaxCounters = 64;
    base::ByteReader reader(*statistics);
    for (int i = 0; i < kMaxCounters; ++i) {
      const auto counter = reader.read<std::uint64_t>();
      if (!counter) break;
      fields.push_back(Array{base::format("%s[%d]", kThread, i), *counter});
    }
  }
  return whole({{"fields", std::move(fields)}, {"items", std::move(items)}}, true, "NA");
}

Dictionary decodedTelemetry(Bytes bytes, const CounterLayout& layout, std::uint32_t channels) {
  if (const auto why = whyNot(BufferKind::telemetry, bytes); !why.empty()) return refused(why);
  if (channels == 0) {
    if (bytes.size() % kChannelSize != 0) {
      return refused(base::format("%zu bytes are no whole number of channels, of %zu bytes each",
                                  bytes.size(), kChannelSize));
    }
    channels = static_cast<std::uint32_t>(bytes.size() / kChannelSize);
  }
  const auto list = parseTelemetryList(bytes, static_cast<std::int32_t>(channels));
  if (!list) return refused(list.error().text);
  Dictionary byIndex;
  for (std::size_t i = 0; i < list->size(); ++i) {
    byIndex.set(std::to_string(i), telemetryLog((*list)[i], chipKind(layout.chip), layout.parse));
  }
  return whole({{"channels", std::move(byIndex)}}, true, "NA");
}

std::span<const CounterLayout> counterLayouts() { return kLayouts; }

const CounterLayout* findCounterLayout(std::string_view name) {
  const auto* layout = std::find_if(std::begin(kLayouts), std::end(kLayouts),
                                    [&](const CounterLayout& row) { return row.name == name; });
  return layout != std::end(kLayouts) ? layout : nullptr;
}

}  // namespace NANDInfo
