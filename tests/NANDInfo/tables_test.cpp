// The tables by their fingerprints: one wrong letter, key or number changes them.

#include <gtest/gtest.h>

#include <algorithm>
#include <string>
#include <vector>

#include "NANDInfo/CounterRecords.h"
#include "NANDInfo/Events.h"
#include "NANDInfo/KeyTables.h"
#include "NANDInfo/Whitelists.h"
#include "NANDInfo/vocabulary/NameRows.h"
#include "support/ControllerBuffers.h"
#include "support/Fingerprint.h"

namespace NANDInfo {
namespace {

std::uint64_t digestInOrder(const std::vector<std::string>& lines) {
  std::string text;
  for (const std::string& line : lines) text += line + "\n";
  return support::fingerprint(text);
}

// Of the lines in bytewise order.
std::uint64_t digestOf(std::vector<std::string> lines) {
  std::ranges::sort(lines);
  return digestInOrder(lines);
}

std::string lineOf(std::string_view name, const std::vector<std::size_t>& numbers) {
  std::string line(name);
  for (const std::size_t number : numbers) line += " " + std::to_string(number);
  return line;
}

TEST(Tables, HoldTheirNamesAndDigitsOnceEach) {
  const auto event = [](const char* name) {
    return EventraConfigDetails(std::string("com.norba.massStorage.NANDInfo.") + name);
  };
  const std::pair<const NameTable*, std::uint64_t> tables[] = {
      {&WhitelistedRawNANDFTLCounters_SigDigDict(), 0x9f9155d605ed4a74},
      {&WhitelistedRawNANDMSPCounters_SigDigDict(), 0x886f8d86b2526163},
      {&WhitelistedStorageStats_SigDigDict(), 0x6836ac9c52a42c16},
      {&PrivacyApprovedSMagNANDFTLCounters_Accum(), 0x938e689259d19ed3},
      {&PrivacyApprovedSMagNANDFTLCounters_Dynamic(), 0xf757393dfba3ec47},
      {&PrivacyApprovedSMagNANDFTLCounters_SigDigDict(), 0x224e9f65799d6ecb},
      {event("FTLCounters_1"), 0xe6c43586349f0197},
      {event("FTLHistograms_1"), 0x2808ebcff73a5ff6},
      {event("FTLHistograms_2"), 0x59befb47e3512cd4},
      {event("MSPCounters_1"), 0xaaab112dcc20c52c},
      {event("SM.Daily.FTLCounters_1"), 0x57622c405bb6ac84},
      {event("SM.WeeklyMA.FTLCounters_1"), 0x2535b454231f4917},
      {event("SM.Monthly.FTLCounters_1"), 0x2535b454231f4917},
      {event("StorageStats_1"), 0xbbb0837fd5900702}};
  for (const auto& row : tables) {
    SCOPED_TRACE(&row - tables);
    const auto& [table, digest] = row;
    ASSERT_NE(table, nullptr);
    std::vector<std::string> lines;
    for (const NameTable::Entry& entry : *table) {
      lines.push_back(lineOf(entry.name, {entry.number}));
      ASSERT_EQ(table->find(entry.name), &entry);
      ASSERT_FALSE(table->contains(std::string(entry.name) + "x"));
    }
    EXPECT_EQ(digestOf(lines), digest);
  }
  EXPECT_EQ(event("NORWrites"), nullptr);
  const auto derived = FTLStats4MSPStats();
  EXPECT_EQ(digestInOrder({derived.begin(), derived.end()}), 0x0e69bd3a0b74e822);
}

// That every one is found is the parsers' business.
TEST(Tables, HoldTheKeysAndTagsOfTheController) {
  std::vector<std::string> keys, tags;
  for (const auto& [key, elements, name] : FTLKeyTable()) {
    keys.push_back(lineOf(name, {key, elements}));
  }
  for (const auto& [tag, width, elements, name] : MSPTagTable()) {
    tags.push_back(lineOf(name, {tag, width, elements}));
  }
  EXPECT_EQ(digestOf(keys), 0x7328e68f7d989f30);
  EXPECT_EQ(digestOf(tags), 0xec0dd69f4eb763f7);
  EXPECT_EQ(findFTLKey(FTLKeyTable().back().key + 1u), nullptr);
}

TEST(Tables, HoldEveryCounterUnderItsKey) {
  std::vector<std::string> lines;
  for (const KeyMapRow& row : keyMapRows()) {
    for (const std::string& counter : expandFamily(row.counters)) {
      lines.push_back(counter + " " + std::string(keyMapKey(counter).value_or("")));
    }
  }
  EXPECT_EQ(digestOf(lines), 0x0cb03a7af4f32c85);
  for (const char* counter : {"", "boots", "padSizes", "padSizes4", "padSizes_0", "PadSize1"}) {
    EXPECT_FALSE(keyMapKey(counter)) << counter;
  }
}

// Word k of the block is k + 1000, words of the record are 7 beforehand: the fingerprint tells
// copied, zeroed and untouched words apart.
TEST(CounterRecords, EachConverterWritesTheWordsOfItsMap) {
  support::Bytes block;
  for (std::uint64_t k = 1000; block.size() < kCounterBlockSize; ++k) support::put(block, k, 4);
  const struct {
    void (*convert)(CounterBlock, NandCountersRecord&);
    std::uint64_t fingerprint;
  } rows[] = {
      {parseCounters1y, 0x8cf41de0364d1580},
      {parseCounters1xSandisk, 0xa643238a1cbde590},
      {parseCounters1xHynix, 0xb81ea124160ffdc5},
      {parseOnlyAlgoGenericCounters, 0x60dfc5d6559117a0},
      {parseCountersAlgoGeneric, 0x60dfc5d6559117a0},
      {parseOnlyAlgoGenericCountersQ8, 0xbf0d94708632bead},
      {parseCountersAlgoGenericQ8, 0xbf0d94708632bead},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(&row - rows);
    NandCountersRecord record;
    record.fill(7);
    row.convert(CounterBlock(block), record);
    std::string text;
    for (const std::uint32_t word : record) text += std::to_string(word) + "\n";
    EXPECT_EQ(support::fingerprint(text), row.fingerprint);
  }
}

}  // namespace
}  // namespace NANDInfo
