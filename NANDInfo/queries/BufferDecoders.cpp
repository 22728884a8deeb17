// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/queries/BufferDecoders.h"

#include <algorithm>
#include <utility>
#include <vector>

#include "NANDInfo/queries/BufferKind.h"
#include "base/Text.h"

namespace NANDInfo {

namespace {

using base::Error;

Outcome outcome(plist::Dictionary decoded) {
  if (decoded.number("ok")->boolValue()) return plist::Value(std::move(decoded));
  const std::string& error = *decoded.text("error");
  Error why{error != "NA" ? error : "nothing in it can be decoded"};
  return {std::move(decoded), std::move(why)};
}

template <auto function>
Outcome decode(Bytes bytes, const BufferOptions&) {
  return outcome(function(bytes));
}

Outcome decodeTelemetry(Bytes bytes, const BufferOptions& options) {
  return outcome(decodedTelemetry(bytes, *findCounterLayout(options.layout), options.channels));
}

Outcome decodeCounters(Bytes bytes, const BufferOptions& options) {
  const CounterLayout* layout = findCounterLayout(options.layout);
  if (auto why = whyNot(BufferKind::counters, bytes); !why.empty()) return Error{std::move(why)};
  if (bytes.size() < layout->words * sizeof(std::uint32_t)) {
    return Error{base::format("%zu bytes, but the layout %s reads %zu", bytes.size(), layout->name,
                              layout->words * sizeof(std::uint32_t))};
  }
  std::vector<std::byte> block(
      bytes.begin(),
      bytes.begin() + static_cast<std::ptrdiff_t>(std::min(bytes.size(), kCounterBlockSize)));
  block.resize(kCounterBlockSize);
  NandCountersRecord record{};
  layout->parse(std::span<const std::byte>(block).first<kCounterBlockSize>(), record);
  plist::Array words;
  for (const std::uint32_t word : record) words.push_back(std::uint64_t{word});
  return plist::Value(std::move(words));
}

constexpr BufferDecoder kDecoders[] = {
    {"ftl", "A buffer's FTL statistics under their names", 0, decode<decodedFTL>},
    {"ftl-stat", "A buffer's FTL statistics under their keys", 0, decode<decodedFTLStat>},
    {"legacy", "A buffer's FTL statistics in their legacy form", 0, decode<decodedLegacy>},
    {"msp", "A buffer's statistics of an MSP", 0, decode<decodedMSP>},
    {"validity", "A validity list: the values of each of its lists", 0, decode<decodedValidity>},
    {"telemetry", "A telemetry list: the summary and the counters of each channel",
     kLayout | kChannels, decodeTelemetry},
    {"defects", "A defects list", 0, decode<decodedDefects>},
    {"snapshot", "A kernel snapshot: the swap-out thread's figures, and its items", 0,
     decode<decodedSnapshot>},
    {"counters", "A counter block as the 177 words of the common layout", kLayout, decodeCounters},
};

}  // namespace

std::span<const BufferDecoder> bufferDecoders() { return kDecoders; }

}  // namespace NANDInfo
