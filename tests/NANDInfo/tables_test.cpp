// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The tables against golden/, which has a line for each name, key and word of them: what they must
// be, whatever rows they are derived from.

#include <gtest/gtest.h>

#include <algorithm>
#include <fstream>
#include <iterator>
#include <map>
#include <string>
#include <vector>

#include "NANDInfo/CounterRecords.h"
#include "NANDInfo/Events.h"
#include "NANDInfo/KeyMap.h"
#include "NANDInfo/KeyTables.h"
#include "NANDInfo/Whitelists.h"
#include "base/Text.h"
#include "support/ControllerBuffers.h"

namespace NANDInfo {
namespace {

using Lines = std::vector<std::string>;

// Tells the lines in which they differ.
void expectGolden(const std::string& name, const Lines& lines, bool ordered = false) {
  std::ifstream file(MORVEND_SOURCE_DIR "/tests/NANDInfo/golden/" + name);
  Lines golden;
  for (std::string line; std::getline(file, line);) golden.push_back(line);
  Lines missing, wrong, sorted = lines, sortedGolden = golden;
  std::ranges::sort(sorted);
  std::ranges::sort(sortedGolden);
  std::ranges::set_difference(sortedGolden, sorted, std::back_inserter(missing));
  std::ranges::set_difference(sorted, sortedGolden, std::back_inserter(wrong));
  EXPECT_EQ(missing, Lines()) << "should be there: " << name;
  EXPECT_EQ(wrong, Lines()) << "should not: " << name;
  EXPECT_TRUE(!ordered || lines == golden) << "in this order: " << name;
}

// One line a name: the lists that have it, each with the digits that it says.
TEST(Tables, HoldTheirNamesAndDigitsOnceEach) {
  std::map<std::string, std::string> lists;
  const auto add = [&lists](const std::string& list, const NameTable& table, bool digits) {
    for (const NameTable::Entry& entry : table) {
      const std::string name(entry.name);
      lists[name] += " " + list + (digits ? ":" + std::to_string(entry.number) : "");
      ASSERT_EQ(table.find(name), &entry) << list;
      ASSERT_FALSE(table.contains(name + "x")) << list;
    }
  };
  add("FTL", WhitelistedRawNANDFTLCounters_SigDigDict(), true);
  add("MSP", WhitelistedRawNANDMSPCounters_SigDigDict(), true);
  add("storage", WhitelistedStorageStats_SigDigDict(), true);
  add("accumulated", PrivacyApprovedSMagNANDFTLCounters_Accum(), true);
  add("dynamic", PrivacyApprovedSMagNANDFTLCounters_Dynamic(), true);
  add("magazine", PrivacyApprovedSMagNANDFTLCounters_SigDigDict(), true);
  constexpr std::string_view kPrefix = "com.norba.massStorage.NANDInfo.";
  for (const char* const event : {"FTLCounters_1", "FTLHistograms_1", "FTLHistograms_2",
                                  "SM.Daily.FTLCounters_1", "SM.WeeklyMA.FTLCounters_1",
                                  "SM.Monthly.FTLCounters_1", "MSPCounters_1", "StorageStats_1"}) {
    add(event, *EventraConfigDetails(std::string(kPrefix) + event), false);
  }
  EXPECT_EQ(EventraConfigDetails(std::string(kPrefix) + "NORWrites"), nullptr);
  Lines lines, fields;
  for (const auto& [name, where] : lists) lines.push_back(name + where);
  for (const NameTable::Entry& entry : FTLStats4MSPStats()) fields.emplace_back(entry.name);
  expectGolden("names.txt", lines);
  expectGolden("derived-fields.txt", fields, true);
}

// Key and elements; tag, width and elements. That every one is found is the parsers' business.
TEST(Tables, HoldTheKeysAndTagsOfTheController) {
  Lines lines;
  for (const auto& [key, elements, name] : FTLKeyTable()) {
    lines.push_back(base::format("%u %u %s", key, elements, name));
  }
  for (const auto& [tag, width, elements, name] : MSPTagTable()) {
    lines.push_back(base::format("0x%04X %u %u %s", tag, width, elements, name));
  }
  expectGolden("keys.txt", lines, true);
  EXPECT_EQ(findFTLKey(FTLKeyTable().back().key + 1u), nullptr);
}

TEST(Tables, HoldEveryCounterUnderItsKey) {
  Lines lines;
  for (const auto& [counter, key] : keyMapEntries()) {
    lines.push_back(std::string(counter) + " " + std::string(key));
    EXPECT_EQ(keyMapKey(counter), key);
  }
  expectGolden("key-map.txt", lines);
  for (const char* counter : {"", "boots", "padSizes", "padSizes4", "padSizes_0", "PadSize1"}) {
    EXPECT_FALSE(keyMapKey(counter)) << counter;
  }
}

// Word k of the block is k + 1000, words of the record are 7 beforehand: a line for each word that
// is written, and that of the block.
TEST(CounterRecords, EachConverterWritesTheWordsOfItsMap) {
  support::Bytes block;
  for (std::uint64_t k = 1000; block.size() < kCounterBlockSize; ++k) support::put(block, k, 4);
  const struct {
    const char* layout;
    void (*convert)(CounterBlock, NandCountersRecord&);
  } rows[] = {
      {"1y", parseCounters1y},
      {"1x-sandisk", parseCounters1xSandisk},
      {"1x-hynix", parseCounters1xHynix},
      {"generic", parseOnlyAlgoGenericCounters},
      {"generic", parseCountersAlgoGeneric},
      {"q8", parseOnlyAlgoGenericCountersQ8},
      {"q8", parseCountersAlgoGenericQ8},
  };
  for (const auto& [layout, convert] : rows) {
    NandCountersRecord record;
    record.fill(7);
    convert(CounterBlock(block), record);
    Lines lines;
    for (std::size_t i = 0; i < record.size(); ++i) {
      if (record[i] == 7) continue;
      const std::string from = record[i] == 0 ? "zero" : std::to_string(record[i] - 1000);
      lines.push_back(std::to_string(i) + " " + from);
    }
    expectGolden(std::string("words-") + layout + ".txt", lines, true);
  }
}

}  // namespace
}  // namespace NANDInfo
