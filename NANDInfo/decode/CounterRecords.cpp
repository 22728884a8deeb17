// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/CounterRecords.h"

#include <algorithm>
#include <tuple>

#include "NANDInfo/decode/CounterWordMaps.h"
#include "base/ByteReader.h"

namespace NANDInfo {

namespace {

using word_maps::kZero, word_maps::WordRun;

constexpr std::size_t kRecordWords = std::tuple_size_v<NandCountersRecord>;
constexpr std::size_t kBlockWords = 533;  // that any map reads
static_assert(kBlockWords * 4 <= kCounterBlockSize);

// Inside block and record, with no word written twice.
constexpr bool isSound(std::span<const WordRun> map) {
  std::size_t written = 0;
  return std::ranges::all_of(map, [&written](const WordRun& run) {
    const bool follows = run.count > 0 && run.output >= written;
    written = std::size_t{run.output} + run.count;
    return follows && written <= kRecordWords &&
           (run.input == kZero || std::size_t{run.input} + run.count <= kBlockWords);
  });
}

static_assert(isSound(word_maps::k1y) && isSound(word_maps::k1xSandisk) &&
              isSound(word_maps::k1xHynix) && isSound(word_maps::kAlgoGeneric) &&
              isSound(word_maps::kAlgoGenericQ8));

std::uint32_t wordAt(CounterBlock block, std::size_t place) {
  return base::littleEndian<std::uint32_t>(block.subspan(place * 4).first<4>());
}

void convert(std::span<const WordRun> map, CounterBlock block, NandCountersRecord& record) {
  for (const auto& [output, input, count] : map) {
    for (std::size_t i = 0; i < count; ++i) {
      record[output + i] = input == kZero ? 0 : wordAt(block, input + i);
    }
  }
}

}  // namespace

void parseCounters1y(CounterBlock block, NandCountersRecord& record) {
  convert(word_maps::k1y, block, record);
}

void parseCounters1xSandisk(CounterBlock block, NandCountersRecord& record) {
  convert(word_maps::k1xSandisk, block, record);
}

void parseCounters1xHynix(CounterBlock block, NandCountersRecord& record) {
  convert(word_maps::k1xHynix, block, record);
}

void parseOnlyAlgoGenericCounters(CounterBlock block, NandCountersRecord& record) {
  convert(word_maps::kAlgoGeneric, block, record);
}

void parseCountersAlgoGeneric(CounterBlock block, NandCountersRecord& record) {
  parseOnlyAlgoGenericCounters(block, record);
}

void parseOnlyAlgoGenericCountersQ8(CounterBlock block, NandCountersRecord& record) {
  convert(word_maps::kAlgoGenericQ8, block, record);
}

void parseCountersAlgoGenericQ8(CounterBlock block, NandCountersRecord& record) {
  parseOnlyAlgoGenericCountersQ8(block, record);
}

}  // namespace NANDInfo
