// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/Parsers.h"

#include <gtest/gtest.h>

#include <numeric>
#include <string>

#include "NANDInfo/APIErrorMessage.h"
#include "NANDInfo/KeyTables.h"
#include "support/ControllerBuffers.h"
#include "support/FreshErrors.h"

namespace NANDInfo {
namespace {

using support::Bytes, support::Fields, support::fieldsOf, support::header, support::MSPRecord,
    support::records, support::RefusingMemory, support::words;
using GenericParser = std::uint32_t(GenericParserCxt*, std::span<const std::byte>);

// Runs a parser over the bytes as they lie in memory of exactly their size.
void expectParse(GenericParser parse, const Bytes& bytes, const Fields& fields,
                 const std::string& message) {
  support::freshErrors();
  GenericParserCxt context;
  EXPECT_EQ(parse(&context, Bytes(bytes)), fields.size());
  EXPECT_EQ(fieldsOf(context), fields);
  EXPECT_EQ(GetAPIErrorMessage(), message);
}

// The message and the total of a parse for which there is no memory.
void expectRefusal(GenericParser parse, const Bytes& bytes, std::uint32_t total,
                   const std::string& message) {
  RefusingMemory memory;
  GenericParserCxt refused(&memory);
  for (GenericParserCxt* context : {&refused, static_cast<GenericParserCxt*>(nullptr)}) {
    support::freshErrors();
    EXPECT_EQ(parse(context, bytes), total);
    EXPECT_EQ(GetAPIErrorMessage(), message);
  }
  EXPECT_TRUE(refused.empty());
}

// A header and as many values, counting up from a number.
std::vector<std::uint64_t> record(std::uint32_t key, std::uint32_t count, std::uint64_t first) {
  std::vector<std::uint64_t> all{header(key, count)};
  for (std::uint32_t i = 0; i < count; ++i) all.push_back(first + i);
  return all;
}

Fields counted(const std::string& name, std::uint32_t count, std::uint64_t first) {
  Fields fields;
  for (std::uint32_t i = 0; i < count; ++i) {
    fields.emplace_back(name + std::to_string(i), first + i);
  }
  return fields;
}

TEST(FTLParser, ReadsRecordsUpToTheEnd) {
  const struct {
    std::vector<std::uint64_t> buffer;
    Fields named, byKey;
    const char* message = "NA";
  } rows[] = {
      {{}, {}, {}},
      {{header(4, 1), 100, header(0xFFFF, 1), 5, header(7, 1), 6},
       {{"hostWrites", 100}},
       {{"Stat_4", 100}}},
      // A header without values is passed over, whatever its key.
      {{header(0xFFFF, 0), header(0x30000001, 0), header(4, 0), header(0, 1), 9},
       {{"Stat_0", 9}},
       {{"Stat_0", 9}}},
      {{header(2000, 3), 1, 2, 3, header(0x30000000, 1), 4, header(0x30000001, 1), 5},
       {{"Stat_2000_0", 1}, {"Stat_2000_1", 2}, {"Stat_2000_2", 3}, {"Stat_805306368", 4}},
       {{"Stat_2000_0", 1}, {"Stat_2000_1", 2}, {"Stat_2000_2", 3}, {"Stat_805306368", 4}}},
      // All values of a single-value key are passed over; equal keys all stay.
      {{header(7, 3), 1, 2, 3, header(7, 1), 4},
       {{"hostReads", 1}, {"hostReads", 4}},
       {{"Stat_7_0", 1}, {"Stat_7_1", 2}, {"Stat_7_2", 3}, {"Stat_7", 4}}},
      // Counts that the buffer can't hold.
      {{header(7, 1), 1, header(4, 2), 2}, {{"hostReads", 1}}, {{"Stat_7", 1}}},
      {{header(4, 0xFFFFFFFF), 2}, {}, {}},
      {{header(2000, 0x20000001), 2}, {}, {}},
      // An array of another length than configured.
      {{header(93, 2), 1, 2, header(124, 3), 3, 4, 5, header(93, 1), 6},
       {{"numBandsRefreshedForAgePerTier_0", 1},
        {"numBandsRefreshedForAgePerTier_1", 2},
        {"coldestCycle_0", 3},
        {"coldestCycle_1", 4},
        {"numBandsRefreshedForAgePerTier_", 6}},
       {{"Stat_93_0", 1},
        {"Stat_93_1", 2},
        {"Stat_124_0", 3},
        {"Stat_124_1", 4},
        {"Stat_124_2", 5},
        {"Stat_93", 6}},
       "ZMCFTLParseBufferToCxt: numBandsRefreshedForAgePerTier(93): (#3) cfg elements != (2) "
       "buffer elements"},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(&row - rows);
    Bytes bytes = words(row.buffer);
    for (int trailing = 0; trailing < 8; ++trailing) {
      expectParse(ZMCFTLParseBufferToCxt, bytes, row.named, row.message);
      expectParse(ZMCFTLParseStatKeyBufferToCxt, bytes, row.byKey, "NA");
      bytes.push_back(std::byte{1});
    }
  }
}

TEST(FTLParser, NamesEveryKeyOfTheTable) {
  for (const auto& [key, elements, name] : FTLKeyTable()) {
    SCOPED_TRACE(name);
    const auto prefix = "ZMCFTLParseBufferToCxt: " + (name + ("(" + std::to_string(key))) + ")";
    const Bytes bytes = words(record(key, elements, 5)),
                more = words(record(key, elements + 1u, 5));
    if (elements == 1) {
      expectParse(ZMCFTLParseBufferToCxt, bytes, {{name, 5}}, "NA");
      expectRefusal(ZMCFTLParseBufferToCxt, bytes, 1, prefix + " cannot add 1 element to context");
    } else {
      const Fields fields = counted(name + std::string("_"), elements, 5);
      const std::string number = std::to_string(elements);
      expectParse(ZMCFTLParseBufferToCxt, bytes, fields, "NA");
      expectParse(ZMCFTLParseBufferToCxt, more, fields,
                  prefix + ": (#" + number + ") cfg elements != (" + std::to_string(elements + 1) +
                      ") buffer elements");
      expectRefusal(ZMCFTLParseBufferToCxt, bytes, 0,
                    prefix + ": Cannot add " + number + " elements to context");
    }
  }
}

// A refused single value is counted and the parse goes on; an array or an unknown key ends it.
TEST(FTLParser, GoesOnOrStopsWhenMemoryIsRefused) {
  const Bytes bytes =
      words({header(1, 1), 1, header(2, 1), 2, header(2000, 2), 3, 4, header(3, 1), 5});
  expectRefusal(ZMCFTLParseBufferToCxt, bytes, 2,
                "ZMCFTLParseBufferToCxt: version(1) cannot add 1 element to context");
  expectRefusal(ZMCFTLParseStatKeyBufferToCxt, bytes, 0,
                "ZMCFTLParseBufferToCxt 1: Cannot add 1 elements to context");
  expectRefusal(ZMCFTLParseBufferToCxt, words({header(2000, 2), 3, 4, header(3, 1), 5}), 0,
                "ZMCFTLParseBufferToCxt 2000: Cannot add 2 elements to context");
}

// What the context drops of a very long array is counted all the same.
TEST(FTLParser, CountsDroppedElements) {
  GenericParserCxt context;
  EXPECT_EQ(ZMCFTLParseBufferToCxt(&context, words(record(2000, 70000, 0))), 70000u);
  EXPECT_EQ(context.size(), 65535u);
}

TEST(MSPParser, ReadsRecordsUpToTheEnd) {
  const struct {
    std::vector<MSPRecord> buffer;
    Fields fields;
    const char* message = "NA";
  } rows[] = {
      {{{0x1000, 4, {5}}, {0x4000, 8, {1ull << 63}}},
       {{"passWithTmodeHard", 5}, {"fw_version_identifier", 1ull << 63}}},
      // An unknown tag, the skip tag and empty headers, the end tag's included, are passed over.
      {{{0x1234, 4, {1, 2, 3, 4}}, {0x2FFE, 1, {9, 9, 9}}, {0x2FFF, 4, {}}, {0x1000, 4, {6}}},
       {{"passWithTmodeHard", 6}}},
      {{{0x1000, 4, {7}}, {0x2FFF, 4, {1}}, {0x1000, 4, {8}}}, {{"passWithTmodeHard", 7}}},
      // A length beyond the end.
      {{{0x1000, 4, {7}}, {0x1001, 4, {1}, 8}}, {{"passWithTmodeHard", 7}}},
      // Payloads longer and shorter than configured; what follows may be unaligned.
      {{{0x1000, 4, {1, 2}}, {0x1001, 4, {3}}},
       {{"passWithTmodeHard", 1}, {"passWithTmodeFS1_2b", 3}},
       "ZMCMSPParseBufferToCxt: passWithTmodeHard(4096): cfg 1 elements; (1*4) cfg bytes != (8) "
       "buffer bytes"},
      {{{0x1000, 1, {1, 2}}, {0x301A, 1, std::vector<std::uint64_t>(17, 1)}, {0x1001, 4, {3}}},
       {{"readStage2100", 0x0101010101010101},
        {"readStage2101", 0x0101010101010101},
        {"passWithTmodeFS1_2b", 3}},
       "ZMCMSPParseBufferToCxt: passWithTmodeHard(4096): cfg 1 elements; (1*4) cfg bytes != (2) "
       "buffer bytes"},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(&row - rows);
    Bytes bytes = records(row.buffer);
    for (int trailing = 0; trailing < 4; ++trailing) {
      expectParse(ZMCMSPParseBufferToCxt, bytes, row.fields, row.message);
      bytes.push_back(std::byte{1});
    }
  }
  expectParse(ZMCMSPParseBufferToCxt, {}, {},
              "ZMCMSPParseBufferToCxt: Passed in invalid buffer or empty buffer");
}

TEST(MSPParser, NamesEveryTagOfTheTable) {
  for (const auto& [tag, width, elements, name] : MSPTagTable()) {
    SCOPED_TRACE(name);
    std::vector<std::uint64_t> values(elements);
    std::iota(values.begin(), values.end(), 5);
    const Bytes bytes = records({{tag, width, values}});
    const auto prefix = "ZMCMSPParseBufferToCxt: " + (name + ("(" + std::to_string(tag))) + "): ";
    const std::string number = std::to_string(elements);
    const Fields fields = elements == 1 ? Fields{{name, 5}} : counted(name, elements, 5);
    expectParse(ZMCMSPParseBufferToCxt, bytes, fields, "NA");
    expectRefusal(ZMCMSPParseBufferToCxt, bytes, 0,
                  prefix + "Error adding " + number + " elements to context");
    values.push_back(1);
    const std::size_t length = values.size() * width;
    expectParse(ZMCMSPParseBufferToCxt, records({{tag, width, values}}), fields,
                prefix + "cfg " + number + " elements; (" + number + "*" + std::to_string(width) +
                    ") cfg bytes != (" + std::to_string(length) + ") buffer bytes");
  }
}

TEST(LegacyParser, ReadsRecordsUpToABadHeader) {
  const struct {
    std::vector<std::uint64_t> buffer;
    bool result;
    Fields fields;
  } rows[] = {
      {{}, false, {}},
      {{header(0xFFFF, 1), 1, header(2000, 1), 2, header(0, 0), header(4, 1), 100},
       true,
       {{"hostWrites", 100}}},
      {{header(289, 3), 1, 2, 3, header(124, 3), 4, 5, 6, header(124, 1), 7},
       true,
       {{"mspBootBlockReadFail0", 1},
        {"mspBootBlockReadFail1", 2},
        {"mspBootBlockReadFail2", 3},
        {"coldestCycle0", 4},
        {"coldestCycle1", 5},
        {"coldestCycle0", 7}}},
      {{header(7, 0), header(4, 2), 1, 2}, true, {{"hostWrites", 1}}},
      {{header(53, 1), 9, header(0x30000001, 0)}, false, {{"exportVersion", 9}}},
      {{header(53, 1), 9, header(7, 2), 1}, false, {{"exportVersion", 9}}},
      {{header(53, 1), 9, header(7, 0xFFFFFFFF), 1}, false, {{"exportVersion", 9}}},
      {{header(53, 1), 9, header(0x30000000, 0)}, true, {{"exportVersion", 9}}},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(&row - rows);
    Bytes bytes = words(row.buffer);
    for (int trailing = 0; trailing < 8; ++trailing) {
      LegacyNandInfoCxt context;
      EXPECT_EQ(ZMCParseBufferToCxt(&context, Bytes(bytes)), row.result);
      EXPECT_EQ(fieldsOf(context.fields), row.fields);
      EXPECT_EQ(context.driverVersion, 0xFFFFFFFFu);
      const bool has53 = row.result && row.fields[0].first == "exportVersion";
      EXPECT_EQ(context.exportVersion, has53 ? 9u : 0u);
      bytes.push_back(std::byte{1});
    }
  }
  EXPECT_FALSE(ZMCParseBufferToCxt(nullptr, words({header(4, 1), 1})));
  ZMCReleaseContext(nullptr);
}

}  // namespace
}  // namespace NANDInfo
