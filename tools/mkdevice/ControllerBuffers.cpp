// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/mkdevice/ControllerBuffers.h"

#include <algorithm>

#include "NANDInfo/CounterRecords.h"
#include "NANDInfo/KeyTables.h"
#include "tools/mkdevice/BufferWriter.h"
#include "tools/mkdevice/Random.h"

namespace mkdevice {

namespace {

constexpr std::size_t kCounterWords = 533;  // of a channel's block, as far as any vendor uses it

Random randomOf(const Wear& wear, const char* name, std::int64_t number = 0) {
  return Random(wear.seed, name, number);
}

std::uint64_t upTo(Random& random, std::int64_t most) {
  return static_cast<std::uint64_t>(random.between(0, most));
}

}  // namespace

std::string ftlStatistics(const Wear& wear) {
  BufferWriter writer;
  for (const NANDInfo::FTLKey& row : NANDInfo::FTLKeyTable()) {
    writer.ftlRecord(row.key, counterValues(wear, row.name, row.elements));
  }
  return writer.bytes();
}

std::string mspStatistics(const Wear& wear, std::uint64_t msp) {
  BufferWriter writer;
  for (const NANDInfo::MSPTag& row : NANDInfo::MSPTagTable()) {
    auto values = counterValues(wear, row.name, row.elements, msp);
    const std::uint64_t most = row.width == 4 ? UINT32_MAX : UINT64_MAX;
    for (std::uint64_t& value : values) value = std::min(value, most);
    writer.mspRecord(row.tag, row.width, values);
  }
  return writer.bytes();
}

// Each band with the list that it is in and how many of its sectors are valid.
std::string bandStatistics(const Wear& wear) {
  constexpr std::uint32_t kBands32 = kBands, kHeaderWords = 4;
  Random random = randomOf(wear, "bands");
  BufferWriter writer;
  writer.word(kBands32);
  writer.word(kHeaderWords / 2);
  writer.zeros(std::size_t{4} * (kHeaderWords - 2));
  for (std::uint32_t band = 0; band < kBands32; ++band) {
    writer.word(band);
    writer.zeros(8);
    writer.word(upTo(random, 15));
    writer.word(upTo(random, std::int64_t{kPagesPerBand} * 4));
  }
  return writer.bytes();
}

std::string telemetryList(const Wear& wear, std::uint32_t list) {
  BufferWriter writer;
  for (std::uint32_t channel = 0; channel < kChannels; ++channel) {
    Random random = randomOf(wear, "telemetry", list * kChannels + channel);
    for (std::size_t i = 0; i < kCounterWords; ++i) {
      const std::uint64_t counter = wear.sinceFormat(40 * random.fraction());
      writer.word(std::min<std::uint64_t>(counter, UINT32_MAX));
    }
    writer.zeros(NANDInfo::kCounterBlockSize - 4 * kCounterWords);
  }
  for (std::uint32_t channel = 0; channel < kChannels; ++channel) {
    Random random = randomOf(wear, "channel", list * kChannels + channel);
    writer.word(upTo(random, 5000));              // reads since the block was written
    writer.word(wear.cycles + upTo(random, 40));  // program and erase cycles
    writer.word(wear.cycles + 40 + upTo(random, 9));
    writer.word(25 + upTo(random, 20));  // degrees
    writer.word(upTo(random, 300));      // hours of retention
    writer.word(list);                   // kind of block
    writer.word(kPagesPerBand / 64);
    writer.word(0);
  }
  return writer.bytes();
}

std::string defectsList(const Wear& wear) {
  constexpr std::uint32_t kReasons[] = {1, 2, 4};
  const std::uint64_t defects = wear.hours / kHoursPerBadBlock;
  BufferWriter writer;
  writer.word(1);
  writer.word(kFactoryBadBlocks);
  writer.word(defects);
  for (std::uint64_t i = 0; i < defects; ++i) {
    Random random = randomOf(wear, "defect", static_cast<std::int64_t>(i));
    writer.word(upTo(random, 3) << 16 | upTo(random, kChannels - 1));  // chip and channel
    writer.word(upTo(random, 1));                                      // plane
    writer.word(upTo(random, kBands - 1));
    writer.word(wear.cycles * i / defects);
    writer.word(kReasons[upTo(random, 2)]);
    writer.word(upTo(random, kPagesPerBand / 64));
    writer.word(static_cast<std::uint64_t>(random.between(-5, 60)) & 0xFF);  // degrees
    writer.word(upTo(random, 2));
  }
  return writer.bytes();
}

std::string unknownBuffer(const Wear& wear, const char* name, std::size_t size) {
  Random random = randomOf(wear, name);
  BufferWriter writer;
  while (writer.bytes().size() < size) writer.number(random.next(), 8);
  return writer.bytes();
}

std::string kernelSnapshot(const Wear& wear) {
  constexpr std::uint32_t kBegin = 0x13, kEnd = 0x14, kEndOfBuffer = 0xF19158ED;
  constexpr std::uint32_t kThreadName = 0x909, kIOStatistics = 0x901, kTime = 0x905;
  constexpr std::string_view kSnapshotKind("\x01\0\0\0", 4), kTaskKind("\x02\0\0\0", 4),
      kThreadKind("\x03\0\0\0", 4);
  const struct {
    std::string_view name;
    std::uint64_t bytesAnHour;
  } kThreads[] = {{"VM_pageout_scan", 0}, {"VM_swapout", 16 << 20}, {"VM_swapin", 0}};
  BufferWriter writer, time;
  time.number(wear.time * 1'000'000, 8);
  writer.chunk(kTime, 0, time.bytes());
  writer.chunk(kBegin, 1, kSnapshotKind);
  for (const std::uint64_t task : {100u, 200u}) {
    writer.chunk(kBegin, task, kTaskKind);
    for (std::uint64_t i = 0; task == 100 && i < std::size(kThreads); ++i) {
      const auto& [name, bytesAnHour] = kThreads[i];
      const std::uint64_t written = bytesAnHour * (1 + wear.hoursSinceBoot());
      BufferWriter statistics;
      for (const std::uint64_t counter : {written / 65536, written, std::uint64_t{0}, written}) {
        statistics.number(counter, 8);
      }
      writer.chunk(kBegin, task + i + 1, kThreadKind);
      writer.chunk(kThreadName, 0, std::string(name) + '\0');
      writer.chunk(kIOStatistics, 0, statistics.bytes());
      writer.chunk(kEnd, task + i + 1);
    }
    writer.chunk(kEnd, task);
  }
  writer.chunk(kEnd, 1);
  writer.chunk(kEndOfBuffer, 0);
  return writer.bytes();
}

}  // namespace mkdevice
