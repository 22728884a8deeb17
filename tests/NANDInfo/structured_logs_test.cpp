// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The controller's diagnostic lists: each parser with valid lists that are then cut or altered, the
// handlers by what they refuse, and the whole dump by the failures of every call.

#include "NANDInfo/StructuredLogs.h"

#include <gtest/gtest.h>
#include <malloc.h>

#include <cmath>
#include <functional>
#include <limits>
#include <string>

#include "NANDInfo/DefectsList.h"
#include "NANDInfo/TelemetryList.h"
#include "NANDInfo/ValidityList.h"
#include "NANDInfo/collect/WriteAmplification.h"
#include "NANDInfo/deliver/ListHandlers.h"
#include "support/ControllerLists.h"
#include "support/StorageDevice.h"

namespace NANDInfo {
namespace {

using platform::fakes::FakeDeviceRegistry;
using plist::Array, plist::Dictionary, plist::Value;
using support::Bytes, support::kEmbedded, support::kQRT3, support::kZMCStorage;
using Entry = FakeDeviceRegistry::Entry;
using Answer = FakeDeviceRegistry::Answer;
using Lines = std::vector<std::string>;

constexpr char kCharacteristics[] = "Controller Characteristics";
constexpr const SelectorPair* kNoPair = nullptr;
constexpr std::uint32_t kError = 0x2BC;
constexpr double kInfinity = std::numeric_limits<double>::infinity();

TEST(WriteAmplification, IsErasedBlocksToHostWrites) {
  const std::uint64_t most = UINT64_MAX;
  const struct {
    std::uint32_t pages, bytesPerPage;
    std::uint64_t erases, hostWrites;
    std::vector<std::pair<const char*, std::uint64_t>> fields;
    double user, intermediate;
  } rows[] = {
      {256, 4096, 10, 1024, {}, 2.5, 0},
      {256, 4096, 10, 3000, {}, 0.853333353996276855, 0},  // single precision
      {1, 4095, 10, 1, {}, 0, 0},
      {0x10000, 0x10001, 16, 16, {}, 16, 0},  // a 32-bit product
      {1, 4096, most, 1, {}, 0x1p64, 0},
      {2, 4096, most, 2, {}, 0x1p63, 0},  // a 64-bit product
      {2, 4096, 1, 0, {}, kInfinity, 0},
      {256, 4096, 1, 256, {{"pagesPerVirtualBlockSlc", 64}, {"intermediateBandErases", 8}}, 1, 2},
      {256, 4096, 1, 256, {{"pagesPerVirtualBlockSlc", 64}}, 1, 0},
      {256, 4096, 1, 256, {{"intermediateBandErases", 8}, {"pagesPerVirtualBlockSlcX", 1}}, 1, 0},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(&row - rows);
    LegacyNandInfoCxt context;
    context.pagesPerVirtualBlock = row.pages;
    context.bytesPerPage = row.bytesPerPage;
    context.bandErases = row.erases;
    context.hostWrites = row.hostWrites;
    for (const auto& [name, value] : row.fields) context.fields.add(name, "", value);
    const WriteAmplification result = writeAmplificationOf(context);
    EXPECT_EQ(result.user, row.user);
    EXPECT_EQ(result.intermediate, row.intermediate);
  }
  EXPECT_TRUE(std::isnan(writeAmplificationOf({}).user));
}

TEST(WriteAmplification, IsHighAboveAThresholdBetween0And10) {
  const auto nan = std::nan("");
  const struct {
    std::optional<Value> preference;
    double threshold;
  } rows[] = {
      {{}, 2},        {1.5, 1.5},           {12.0, 2},          {10.0, 2},  {0.0, 2},
      {-1.0, 2},      {std::int32_t{1}, 2}, {true, 2},          {"1.5", 2}, {nan, 2},
      {kInfinity, 2}, {1e-300, 2},          {9.99999999999, 2}, {9.5, 9.5}, {Value(3.25F), 3.25}};
  for (const auto& [preference, threshold] : rows) {
    SCOPED_TRACE(threshold);
    EXPECT_TRUE(isHighWriteAmplification(std::nextafter(threshold, 11), preference));
    EXPECT_TRUE(isHighWriteAmplification(kInfinity, preference));
    EXPECT_FALSE(isHighWriteAmplification(threshold, preference));
    EXPECT_FALSE(isHighWriteAmplification(nan, preference));
  }
}

TEST(ValidityList, RecordsGoToTheirListsInOrder) {
  const std::vector<std::pair<std::uint32_t, std::uint32_t>> records = {
      {3, 10}, {16, 1}, {7, 70000}, {3, 5}, {0x103, 2}, {0, 0}, {15, 0xFFFFFFFF}};
  for (const std::uint32_t headerUnits : {1u, 2u, 100u}) {
    const Bytes bytes = support::validityList(headerUnits, records);
    const auto lists = parseValidityList(bytes);
    ASSERT_TRUE(lists);
    ValidityLists expected;
    expected[0] = {0};
    expected[3] = {10, 5};
    expected[7] = {70000};
    expected[15] = {-1};
    EXPECT_EQ(*lists, expected);
    for (std::size_t size = 0; size < bytes.size(); ++size) {
      EXPECT_FALSE(
          parseValidityList(Bytes(bytes.begin(), bytes.begin() + static_cast<long>(size))));
    }
  }
  // Counts that only a multiplication in 32 bits would believe, and no records.
  for (const auto& [count, units] : std::vector<std::pair<std::uint32_t, std::uint32_t>>{
           {0, 1}, {0xCCCCCCCD, 1}, {1, 0x20000001}, {0xFFFFFFFF, 0xFFFFFFFF}, {2, 1}}) {
    Bytes bytes = support::words32({count, units});
    bytes.resize(28);
    EXPECT_FALSE(parseValidityList(bytes)) << count;
  }
  EXPECT_TRUE(parseValidityList(Bytes(support::words32({1, 0, 0, 0, 0}))));  // the header a record
}

TEST(TelemetryList, ChannelsAreConvertedAsChipAndVendorSay) {
  const Bytes bytes = support::telemetryList(2);
  const auto channels = *parseTelemetryList(bytes, 2);
  const std::uint64_t hynix = 0xAD8252232100, sandisk = 0x4582603A5700;
  const struct {
    const char* chip;
    std::uint64_t vendor;
    CounterConverter* convert;
    std::size_t readStages, dspExceptions;
  } rows[] = {{"QM7", hynix, parseCountersAlgoGeneric, 23, 12},
              {"QM8", sandisk, parseCountersAlgoGenericQ8, 33, 38},
              {"QM9", sandisk, parseCounters1xSandisk, 23, 12},
              {"", 0x458260DE5700, parseCounters1xSandisk, 23, 12},
              {"qm7", hynix, parseCounters1xHynix, 23, 12},
              {"QM7 ", 1, parseCounters1y, 23, 12}};
  for (const auto& row : rows) {
    SCOPED_TRACE(row.chip);
    const ChipKind chip = chipKind(row.chip);
    ASSERT_EQ(counterConverter(chip, row.vendor), row.convert);
    NandCountersRecord record{};
    row.convert(channels[1].counters, record);
    const Dictionary log = telemetryLog(channels[1], chip, row.convert);
    Dictionary expected;
    std::int32_t summary = 100;
    for (const char* name : {"RD", "PE", "Max_PE_rate", "t0", "Ret", "block_type", "num_pages"}) {
      expected.set(name, summary++);
    }
    const auto expect = [&](const char* name, std::size_t first, std::size_t count) {
      for (std::size_t i = 0; i < count; ++i) {
        expected.set(name + ("[" + std::to_string(i)) + "]",
                     static_cast<std::int32_t>(record[first + i]));
      }
    };
    expect("readStage", 0, row.readStages);
    expect("initialReadStage", 33, 23);
    expect("nandStageOfLife", 56, 8);
    expect("dspExceptionParameter", 65, row.dspExceptions);
    expect("readStage18NumOfErrorsBin", 103, 12);
    expect("readStage9NumOfErrorsBin", 115, 10);
    expect("readStage10NumOfErrorsBin", 125, 10);
    expect("readStage17NumOfErrorsBin", 135, 10);
    expect("readStage19NumOfErrorsBin", 145, 12);
    expect("algoNANDAccessesBin", 157, chip == ChipKind::QM7 ? 8 : 0);
    expect("retentionIndication", 165, chip == ChipKind::QM8 ? 12 : 0);
    EXPECT_EQ(description(log), description(expected));  // the order too
  }
}

TEST(DefectsList, HoldsTheRecordsThatAreClaimedAndFit) {
  Bytes bytes = support::defectsList(
      7, {{0xABCD1234, 1, 2, 3, 0x80000000, 5, 0xFFFFFFF6, 2}, {0, 9, 9, 9, 9, 9, 9, 9}});
  for (const unsigned count : {0U, 1U, 3U}) {
    bytes[8] = static_cast<std::byte>(count);
    EXPECT_EQ(DefectsList::parse(bytes)->size(), std::min<std::size_t>(count, 2));
  }
  const auto list = DefectsList::parse(std::span(bytes).first(75));
  EXPECT_EQ(list->factoryCount(), 7u);
  ASSERT_EQ(list->size(), 1u);
  EXPECT_EQ(description(defectLog((*list)[0])), description(Dictionary{{"Bus", 0x1234},
                                                                       {"CE", 0xABCD},
                                                                       {"CAU", 1},
                                                                       {"Block", 2},
                                                                       {"Cycle", 3},
                                                                       {"Reason", INT32_MIN},
                                                                       {"Page", 5},
                                                                       {"Temperature", -10}}));
}

struct StructuredLogsTest : testing::Test, support::StorageDevice {
  StructuredLogsTest() { restart(); }

  // A controller that answers everything, with a write amplification of 3.
  void restart() {
    EXPECT_EQ(registry.problems(), Lines());
    ResetExporters();
    gForceCollectionSet = false;
    registry = FakeDeviceRegistry();
    registry.add({.className = "Bus",
                  .properties = {{kCharacteristics, characteristics}},
                  .children = {{.className = kEmbedded}}});
    const auto header = [](std::uint32_t key) { return support::header(key, 1); };
    registry.alwaysTunnels(
        9, 13, 0,
        support::words({header(49), 4096, header(50), 64, header(4), 256, header(20), 12}));
    registry.alwaysTunnels(9, 11, 0, support::validityList(1, {{3, 1}, {7, 2}, {3, 4}}));
    for (std::uint32_t i = 0; i < 3; ++i) {
      registry.alwaysTunnels(9, 17, i, support::telemetryList(2));
    }
    registry.alwaysTunnels(9, 15, 0, support::defectsList(2, {{0, 0, 0, 0, 0, 0, 0, 0}}));
    streams.errors.clear();
    housekeeping.structured.clear();
    submission.logs.clear();
    preferences.values.clear();
  }

  Dictionary characteristics{{"chip-id", "QM7"},
                             {"manufacturer-id", "AD8252232142"},
                             {"num-bus", 2},
                             {"nand-device-desc", -1.0}};
  const Lines& errors = streams.errors;
  const std::vector<std::pair<std::int32_t, Dictionary>>& structured = housekeeping.structured;
};

TEST_F(StructuredLogsTest, ADumpFetchesTheListsInOrderAndLogsThem) {
  for (const bool flag : {false, true}) {
    restart();
    EXPECT_TRUE(DumpStorageStructuredLog(platform, flag));
    EXPECT_EQ(errors, Lines());
    const Lines statistics = {std::string("open ") + kEmbedded, "9 size 13/0", "9 data 13/0"};
    Lines expected = statistics;
    expected.push_back(statistics[0]);
    for (const char* list : {"11/0", "17/0", "17/1", "17/2", "15/0"}) {
      for (const char* phase : {"9 size ", "9 data "}) {
        expected.push_back(std::string(phase) + list);
        // The validity list's handler asks for the statistics in between.
        if (expected.back() == "9 data 11/0") {
          expected.insert(expected.end(), statistics.begin(), statistics.end());
        }
      }
    }
    EXPECT_EQ(registry.calls, expected);
    const std::uint32_t bit = flag ? 2 : 0;
    EXPECT_EQ(registry.inputs[2], support::words32({11, bit | 1, 0, 0, 0, 0}));
    EXPECT_EQ(registry.inputs[3], support::words32({11, bit, 0, 0, 0, 0}));
    EXPECT_EQ(registry.inputs[10], support::words32({17, bit | 2 << 2 | 1, 0, 0, 0, 0}));
    EXPECT_EQ(registry.inputs[11], support::words32({17, bit | 2 << 2, 0, 0, 0, 0}));

    ASSERT_EQ(structured.size(), 3u * 2 + 2);
    for (const auto& entry : structured) EXPECT_EQ(entry.first, 176);
    EXPECT_EQ(structured[1].second.number("RD")->int64Value(), 100);
    EXPECT_EQ(structured[6].second,
              (Dictionary{{"Factory Count", 2}, {"com.norba.NANDInfo.nandDesc", -1}}));
    ASSERT_EQ(submission.logs.size(), 1u);
    EXPECT_EQ(submission.logs[0].type, "165");
    const std::string& text = submission.logs[0].contents;
    EXPECT_NE(text.find(": IntermediateWamp:0.00;UserWamp:3.00;"), text.npos) << text;
    EXPECT_NE(text.find(";ValidityList[3]:1,4;ValidityList[7]:2\n"), text.npos) << text;
    EXPECT_NE(text.find(std::string(kNANDInfoBytesPerPageKey) + ":4096;"), text.npos) << text;
    EXPECT_EQ(text.find(kNANDInfoExportVersionKey), text.npos);
  }
}

TEST_F(StructuredLogsTest, TheValidityListIsLoggedWhenItIsWanted) {
  const struct {
    std::optional<Value> preference;
    bool forced, statisticsFail, logged;
  } rows[] = {{{}, false, false, true},
              {5.0, false, false, false},
              {5.0, true, false, true},
              {{}, false, true, false},
              {{}, true, true, true}};
  for (const auto& row : rows) {
    SCOPED_TRACE(&row - rows);
    restart();
    gForceCollectionSet = row.forced;
    if (row.preference) {
      preferences.setMobile("com.norba.NANDInfo", "userWAmp", *row.preference);
    }
    if (row.statisticsFail) registry.standing.erase("9 data 13/0");
    EXPECT_TRUE(DumpStorageStructuredLog(platform, false));
    ASSERT_EQ(submission.logs.size(), row.logged ? 1u : 0u);
    if (row.logged) {
      const char* const user = row.statisticsFail ? "UserWamp:0.00;" : "UserWamp:3.00;";
      EXPECT_NE(submission.logs[0].contents.find(user), std::string::npos);
    }
    EXPECT_EQ(structured.size(), 8u);
  }
}

// A list isn't to hold what was in the memory before it: such bytes would go into logs.
TEST_F(StructuredLogsTest, WhatTheDriverLeavesOutIsZero) {
  const Bytes list = support::defectsList(1, {{9, 9, 9, 9, 9, 9, 9, 0}});
  registry.alwaysTunnels(9, 15, 0, list);
  registry.standing["9 data 15/0"].output.resize(list.size() - 32);
  ::mallopt(M_PERTURB, 0xA5);
  EXPECT_TRUE(DumpStorageStructuredLog(platform, false));
  ::mallopt(M_PERTURB, 0);
  EXPECT_EQ(structured.back().second, defectLog({}));
}

// A call or a list that fails, what is said of it, and what is logged all the same.
TEST_F(StructuredLogsTest, AFailureEndsOneListOnly) {
  const auto say = [&](const char* call, Answer answer) {
    return [this, call, answer] { registry.standing[call] = answer; };
  };
  const auto announce = FakeDeviceRegistry::announce;
  const auto list = [&](std::uint32_t opType, std::size_t size) {
    return [this, opType, size] { registry.alwaysTunnels(9, opType, 0, Bytes(size)); };
  };
  nand_exporter_t& driver = nand_exporters_tunnel[1];
  Entry* controller = nullptr;
  const std::string failed = "DrvCallStructMethod failed with status 0x2bc on selector index ";
  const std::string notFetched = "Could not retrieve data from driver for selector 17\n";
  const std::string beyond = "ERROR: Attempting to parse beyond the bounds of the buffer\n";
  const std::string tooLarge = "Could not malloc ";
  const std::string unparsable = "data cannot be parsed";
  const std::string validity = "Validity list retrieval is not supported\n";
  const std::string telemetry = "Telemetry list retrieval is not supported\n";
  const std::string defects = "Defects list retrieval is not supported\n";
  const auto noValidity = [&] { driver.getBandStatsSelectors = nullptr; };
  const auto noTelemetry = [&] { driver.getTelemetryListSelectors = nullptr; };
  const auto noPair = [&] { driver.getTelemetryListSelectors = [] { return kNoPair; }; };
  const auto noChip = [&] {
    controller->properties = {{kCharacteristics, Dictionary{{"num-bus", 1}}}};
  };
  const auto noDefects = [&] { driver.getDefectsListSelectors = nullptr; };
  const Answer oneByte{.output = Bytes(1, std::byte{12})};
  const Answer overlong{.output = Bytes(44), .claimedSize = ~0u};
  const struct {
    std::vector<std::function<void()>> prepare;
    Lines errors;
    bool result;
    std::size_t submitted, structured;
  } rows[] = {
      {{say("9 size 11/0", {kError})}, {failed + "0\n"}, true, 0, 8},
      {{noValidity, say("9 size 15/0", {kError})}, {validity, failed + "3\n"}, true, 0, 6},
      {{say("9 data 17/1", {kError})}, {notFetched}, true, 1, 6},
      {{say("9 size 17/2", announce(0))}, {}, true, 1, 6},
      {{say("9 size 15/0", oneByte)}, {}, true, 1, 7},
      {{say("9 data 15/0", overlong)}, {}, true, 1, 7},
      {{say("9 data 11/0", {})}, {unparsable}, false, 0, 8},
      {{say("9 size 17/0", announce(1 << 24))}, {}, true, 1, 8},
      {{say("9 size 17/0", announce(1 << 24 | 1))}, {tooLarge + "16777217 bytes"}, false, 1, 6},
      {{say("9 size 15/0", announce(~0u))}, {tooLarge + "4294967295 bytes"}, false, 1, 6},
      {{list(17, 8255)}, {beyond}, false, 1, 6},
      {{list(11, 40), list(15, 11)}, {unparsable, unparsable}, false, 0, 6},
      {{noPair}, {}, false, 1, 2},
      {{noValidity, noTelemetry, noDefects}, {validity, telemetry, defects}, true, 0, 0},
      {{noChip}, Lines(3, "ERROR: Could not determine the chip-id\n"), false, 1, 2},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(&row - rows);
    restart();
    controller = &registry.root->children[0].children[0];
    for (const auto& step : row.prepare) step();
    EXPECT_EQ(DumpStorageStructuredLog(platform, false), row.result);
    EXPECT_EQ(errors, row.errors);
    EXPECT_EQ(submission.logs.size(), row.submitted);
    EXPECT_EQ(structured.size(), row.structured);
  }
}

TEST_F(StructuredLogsTest, WithoutAServiceOrAConnectionThereIsNothing) {
  const std::string noService = "Could not get matching Regmora service for exporting classes\n";
  const std::string notOpened = "Could not get connection to service\n";
  const std::string notClosed = "Could not close connection to service\n";
  const std::string walking =
      "Failed to find matching service with DrvGetMatchingService, trying iterator...\n";
  const std::string noProperties = "failed to create dictionary";
  const Entry unopened{.className = kQRT3, .openStatus = kError};
  const Entry handleless{.className = kQRT3, .oddHandle = true};
  const Entry oddlyUnopened{.className = kQRT3, .openStatus = kError, .oddHandle = true};
  const Entry bare{.className = kQRT3, .closeStatus = kError};
  Entry full = bare;
  full.properties = {{kCharacteristics, characteristics}};
  const struct {
    std::vector<Entry> plane;
    bool result;
    Lines errors;
    std::size_t structured;
  } rows[] = {{{}, false, {walking, noService, walking, noService}, 0},
              {{unopened}, false, {notOpened, notOpened}, 0},
              {{handleless}, false, {notOpened}, 0},
              {{oddlyUnopened}, false, {notOpened, notOpened}, 0},
              {{bare}, false, {notClosed, noProperties, notClosed}, 0},
              {{full}, true, {notClosed, notClosed}, 8}};
  for (const auto& row : rows) {
    SCOPED_TRACE(&row - rows);
    restart();
    registry.root->children = row.plane;
    EXPECT_EQ(DumpStorageStructuredLog(platform, false), row.result);
    EXPECT_EQ(errors, row.errors);
    EXPECT_EQ(structured.size(), row.structured);
    Dictionary untouched{{"key", 1}};
    if (!row.result) DumpNANDInfo(platform, untouched);
    EXPECT_EQ(untouched, (Dictionary{{"key", 1}}));
  }
}

TEST_F(StructuredLogsTest, TelemetryNeedsThreeCharacteristics) {
  const auto with = [&](const char* key, std::optional<Value> value) -> Value {
    Dictionary changed = characteristics;
    changed.remove(key);
    if (value) changed.set(key, *value);
    return changed;
  };
  const std::string missing = "ERROR: Could not determine the ",
                    no = "ERROR: ", noText = " is not stored as a OrvalstrTypeID\n";
  const std::string noCount = "ERROR: could not determine the number of channels\n";
  const struct {
    Value characteristics;
    std::string error;
    std::size_t logs;
  } rows[] = {
      {Array{}, "ERROR: Could not parse the Device Characteristics dictionary\n", 0},
      {with("chip-id", {}), missing + "chip-id\n", 0},
      {with("chip-id", plist::Data{1}), no + "chip-id" + noText, 0},
      {with("chip-id", std::string(63, 'Q')), "", 2},
      {with("chip-id", std::string(64, 'Q')),
       "ERROR: Unable to obtain chip-id as conversion from the UniChar contents of Orvalstr "
       "failed, or the buffer of 64 bytes is too small\n",
       0},
      {with("manufacturer-id", {}), missing + "manufacturer-id\n", 0},
      {with("manufacturer-id", 7), no + "manufacturer-id" + noText, 0},
      {with("manufacturer-id", ""), "", 2},
      {with("num-bus", {}), noCount, 0},
      {with("num-bus", "2"), noCount, 0},
      {with("num-bus", -1), "", 0},
      {with("num-bus", 1), "", 1},
      {with("num-bus", 3), "ERROR: Attempting to parse beyond the bounds of the buffer\n", 0},
      {with("num-bus", std::int64_t{0x100000002}), "", 2},
  };
  for (const auto& row : rows) {
    restart();
    SCOPED_TRACE(&row - rows);
    const auto handled = DumpTelemetryList(platform.faultwatch, streams, row.characteristics,
                                           support::telemetryList(2));
    EXPECT_EQ(handled ? "" : handled.error().text, row.error);
    EXPECT_EQ(structured.size(), row.logs);
  }
  // The vendor's lowest byte doesn't count, and only six are read.
  const auto readStage = [&](const char* vendor) {
    restart();
    const auto changed = with("manufacturer-id", vendor);
    EXPECT_TRUE(
        DumpTelemetryList(platform.faultwatch, streams, changed, support::telemetryList(2)));
    return structured[0].second.number("readStage[4]")->int64Value();
  };
  characteristics.set("chip-id", "");
  EXPECT_EQ(readStage("ad82522321ff99"), readStage("AD8252232100"));
  EXPECT_NE(readStage("AD8252232000"), readStage("AD8252232100"));
}

TEST_F(StructuredLogsTest, TheDefectModeCountsOnNewerDriversOnly) {
  const auto reasons = [&](const char* className, const Value& properties) {
    restart();
    std::vector<std::vector<std::uint32_t>> records;
    for (const std::uint32_t mode : {0u, 1u, 2u, 3u, 0xFFFFFFFFu}) {
      records.push_back({0, 0, 0, 0, 50, 0, 0, mode});
    }
    EXPECT_TRUE(DumpDefectsList(platform.faultwatch, streams, properties, className,
                                support::defectsList(0, records)));
    std::vector<std::int64_t> all;
    for (const auto& entry : structured) {
      if (const auto* reason = entry.second.number("Reason")) all.push_back(reason->int64Value());
    }
    return all;
  };
  EXPECT_EQ(reasons(kEmbedded, characteristics), (std::vector<std::int64_t>{50, 250, 150, 50, 50}));
  EXPECT_EQ(errors, (Lines{"Encountered unexpected defectMode: 0x3",
                           "Encountered unexpected defectMode: 0xffffffff"}));
  EXPECT_EQ(reasons(kZMCStorage, "no dictionary"), std::vector<std::int64_t>(5, 50));
  EXPECT_EQ(errors, Lines());
  EXPECT_EQ(structured[0].second, (Dictionary{{"Factory Count", 0}}));
}

}  // namespace
}  // namespace NANDInfo
